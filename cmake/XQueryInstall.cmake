# What is installed: the library, its public headers, the command with the completions of shells, the
# documents and examples, a CMake package and a pkg-config file. Each component becomes a package of
# its own (XQueryPackages); what is in none of them Debian has elsewhere.

include(CMakePackageConfigHelpers)

install(TARGETS xquery EXPORT xqueryTargets
        LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}" COMPONENT library
        NAMELINK_COMPONENT development)
install(DIRECTORY "${PROJECT_SOURCE_DIR}/include/xquery" DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}"
        COMPONENT development)
if(TARGET xquery-command)
  set_target_properties(xquery-command PROPERTIES
    INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
  install(TARGETS xquery-command RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}" COMPONENT command)
  set(completions "${PROJECT_BINARY_DIR}/completions")
  install(FILES "${completions}/xquery"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/bash-completion/completions" COMPONENT command)
  install(FILES "${completions}/_xquery"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/zsh/site-functions" COMPONENT command)
  install(FILES "${completions}/xquery.fish"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d" COMPONENT command)
  install(FILES "${PROJECT_BINARY_DIR}/xquery.1" DESTINATION "${CMAKE_INSTALL_MANDIR}/man1"
          COMPONENT command)
endif()

# As they lie here, so that the documents' links lead somewhere.
install(FILES "${PROJECT_SOURCE_DIR}/LICENSE" DESTINATION "${CMAKE_INSTALL_DOCDIR}"
        COMPONENT license)
install(FILES "${PROJECT_SOURCE_DIR}/README.md" "${PROJECT_SOURCE_DIR}/CONTRIBUTING.md"
        DESTINATION "${CMAKE_INSTALL_DOCDIR}" COMPONENT command)
install(DIRECTORY "${PROJECT_SOURCE_DIR}/docs" "${PROJECT_SOURCE_DIR}/examples"
        DESTINATION "${CMAKE_INSTALL_DOCDIR}" COMPONENT command PATTERN CMakeLists.txt EXCLUDE)
install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples"
        DESTINATION "${CMAKE_INSTALL_DATADIR}/doc/libxquery-dev" COMPONENT development
        FILES_MATCHING PATTERN "*.c" PATTERN "*.cpp" PATTERN modules EXCLUDE)

set(package_dir "${CMAKE_INSTALL_LIBDIR}/cmake/xquery")
install(EXPORT xqueryTargets NAMESPACE xquery:: DESTINATION "${package_dir}"
        COMPONENT development)
configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/xqueryConfig.cmake.in"
  "${PROJECT_BINARY_DIR}/xqueryConfig.cmake" INSTALL_DESTINATION "${package_dir}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/xqueryConfigVersion.cmake"
  COMPATIBILITY SameMinorVersion)
install(FILES "${PROJECT_BINARY_DIR}/xqueryConfig.cmake"
              "${PROJECT_BINARY_DIR}/xqueryConfigVersion.cmake" DESTINATION "${package_dir}"
        COMPONENT development)

file(RELATIVE_PATH prefix_from_pkgconfig "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
configure_file("${PROJECT_SOURCE_DIR}/cmake/xquery.pc.in" "${PROJECT_BINARY_DIR}/xquery.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/xquery.pc" DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig"
        COMPONENT development)
