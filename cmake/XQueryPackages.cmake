# Debian packages: `cpack -G DEB` in the build directory makes one for each component of what is
# installed (XQueryInstall), with the dependencies that its binaries really have.
#
#   libxquery0       library       the shared library
#   libxquery-dev    development   headers, CMake and pkg-config files, programs to begin with
#   xquery           command       the command, its manual page and completions, the documents
#   python3-xquery   python        the Python module, where it is built

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_VENDOR "libxquery.example")
set(CPACK_PACKAGE_CONTACT "The xquery maintainers <maintainers@libxquery.example>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_PRE_BUILD_SCRIPTS "${PROJECT_SOURCE_DIR}/cmake/packages/finish.cmake")
set(CPACK_PROJECT_CONFIG_FILE "${PROJECT_BINARY_DIR}/library.cmake")
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE
    GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
configure_file("${PROJECT_SOURCE_DIR}/cmake/packages/library.cmake.in"
               "${PROJECT_BINARY_DIR}/library.cmake" @ONLY)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_GROUPING IGNORE)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_PACKAGE_SOURCE xquery)
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS "${PROJECT_BINARY_DIR}")

set(this_version "(= ${PROJECT_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE})")
set(CPACK_COMPONENTS_ALL "")

# package(COMPONENT NAME SECTION DEPENDS SYNOPSIS TEXT)
macro(package component name section depends synopsis text)
  list(APPEND CPACK_COMPONENTS_ALL ${component})
  string(TOUPPER ${component} key)
  set(CPACK_DEBIAN_${key}_PACKAGE_NAME ${name})
  set(CPACK_DEBIAN_${key}_PACKAGE_SECTION ${section})
  set(CPACK_DEBIAN_${key}_PACKAGE_DEPENDS "${depends}")
  set(CPACK_DEBIAN_${key}_DESCRIPTION "${synopsis}
This engine evaluates XQuery 1.0 as the drafts of October 2004 define it,
over documents in memory and, record by record, over documents of any length.
.
${text}")
  set(documents "${CMAKE_INSTALL_DATADIR}/doc/${name}")
  install(FILES "${PROJECT_SOURCE_DIR}/cmake/packages/copyright" DESTINATION "${documents}"
          COMPONENT ${component} EXCLUDE_FROM_ALL)
  install(FILES "${PROJECT_SOURCE_DIR}/cmake/packages/changelog" DESTINATION "${documents}"
          RENAME changelog.Debian COMPONENT ${component} EXCLUDE_FROM_ALL)
  # What lintian is told not to mind, with the reasons. The macro's arguments are no variables.
  set(name "${name}")
  set(overrides_for_folders "")
  if(name STREQUAL "libxquery-dev" AND NOT CMAKE_INSTALL_LIBDIR MATCHES "^lib/.+")
    string(CONCAT overrides_for_folders
      "# This build was told to keep libraries of one architecture only.\n"
      "${name}: pkg-config-unavailable-for-cross-compilation\n")
  endif()
  configure_file("${PROJECT_SOURCE_DIR}/cmake/packages/overrides.in"
                 "${PROJECT_BINARY_DIR}/overrides/${name}" @ONLY)
  install(FILES "${PROJECT_BINARY_DIR}/overrides/${name}"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/lintian/overrides"
          COMPONENT ${component} EXCLUDE_FROM_ALL)
endmacro()

package(library libxquery${PROJECT_VERSION_MAJOR} libs "" "engine for XQuery - shared library"
  "This package holds the library.")

package(development libxquery-dev libdevel "libxquery${PROJECT_VERSION_MAJOR} ${this_version}"
  "engine for XQuery - headers and examples"
  "This package holds what is needed to build programs with the library:
headers, files for CMake and pkg-config, and programs to begin with.")

if(TARGET xquery-command)
  set(CPACK_DEBIAN_COMMAND_PACKAGE_SHLIBDEPS ON)
  package(command xquery text "libxquery${PROJECT_VERSION_MAJOR} ${this_version}"
    "engine for XQuery - command"
    "This package holds the command, which also cuts large documents into pieces,
and the documents about the language.")
endif()

if(TARGET xquery_python)
  set(CPACK_DEBIAN_PYTHON_PACKAGE_SHLIBDEPS ON)
  set(CPACK_DEBIAN_PYTHON_PACKAGE_CONTROL_EXTRA "${PROJECT_SOURCE_DIR}/cmake/packages/prerm")
  # The command cuts documents for a cluster.
  set(CPACK_DEBIAN_PYTHON_PACKAGE_SUGGESTS "python3-distributed, python3-lxml, xquery")
  math(EXPR next_minor "${Python_VERSION_MINOR} + 1")
  string(CONCAT python_depends "libxquery${PROJECT_VERSION_MAJOR} ${this_version}, "
    "python3 (>= ${Python_VERSION_MAJOR}.${Python_VERSION_MINOR}), "
    "python3 (<< ${Python_VERSION_MAJOR}.${next_minor}~)")
  package(python python3-xquery python "${python_depends}" "engine for XQuery - Python module"
    "This package holds the module for Python, with the part that evaluates a query
over many documents on many machines.")
endif()

include(CPack)
