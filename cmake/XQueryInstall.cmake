# What is installed: the library, its public headers, the command with the completions of shells, the
# documents and examples, a CMake package and a pkg-config file.

include(CMakePackageConfigHelpers)

install(TARGETS xquery EXPORT xqueryTargets
        LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}")
install(DIRECTORY "${PROJECT_SOURCE_DIR}/include/xquery" DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}")
if(TARGET xquery-command)
  set_target_properties(xquery-command PROPERTIES
    INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
  install(TARGETS xquery-command RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}")
  set(completions "${PROJECT_BINARY_DIR}/completions")
  install(FILES "${completions}/xquery"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/bash-completion/completions")
  install(FILES "${completions}/_xquery"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/zsh/site-functions")
  install(FILES "${completions}/xquery.fish"
          DESTINATION "${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d")
  install(FILES "${PROJECT_BINARY_DIR}/xquery.1" DESTINATION "${CMAKE_INSTALL_MANDIR}/man1")
endif()

install(FILES "${PROJECT_SOURCE_DIR}/LICENSE" DESTINATION "${CMAKE_INSTALL_DOCDIR}")
install(DIRECTORY "${PROJECT_SOURCE_DIR}/docs/" DESTINATION "${CMAKE_INSTALL_DOCDIR}"
        FILES_MATCHING PATTERN "*.md")
install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples" DESTINATION "${CMAKE_INSTALL_DOCDIR}"
        PATTERN CMakeLists.txt EXCLUDE)

set(package_dir "${CMAKE_INSTALL_LIBDIR}/cmake/xquery")
install(EXPORT xqueryTargets NAMESPACE xquery:: DESTINATION "${package_dir}")
configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/xqueryConfig.cmake.in"
  "${PROJECT_BINARY_DIR}/xqueryConfig.cmake" INSTALL_DESTINATION "${package_dir}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/xqueryConfigVersion.cmake"
  COMPATIBILITY SameMinorVersion)
install(FILES "${PROJECT_BINARY_DIR}/xqueryConfig.cmake"
              "${PROJECT_BINARY_DIR}/xqueryConfigVersion.cmake" DESTINATION "${package_dir}")

file(RELATIVE_PATH prefix_from_pkgconfig "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
configure_file("${PROJECT_SOURCE_DIR}/cmake/xquery.pc.in" "${PROJECT_BINARY_DIR}/xquery.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/xquery.pc" DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
