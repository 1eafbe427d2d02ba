# Makes of what is installed what Debian expects of packages; run by CPack before it packs them. The
# trees of the packages lie in one folder each, below CPACK_TEMPORARY_DIRECTORY.

file(GLOB trees LIST_DIRECTORIES TRUE "${CPACK_TEMPORARY_DIRECTORY}/*")
foreach(tree IN LISTS trees)
  if(NOT EXISTS "${tree}/usr")
    continue()
  endif()

  # Libraries are where the system looks for them.
  if(EXISTS "${tree}/usr/bin/xquery")
    file(RPATH_REMOVE FILE "${tree}/usr/bin/xquery")
  endif()
  file(GLOB_RECURSE modules "${tree}/usr/lib/python3/dist-packages/*.so")
  foreach(module IN LISTS modules)
    file(RPATH_REMOVE FILE "${module}")
  endforeach()

  # Without the time of day, so that the same build gives the same packages.
  file(GLOB_RECURSE texts "${tree}/usr/share/man/man1/*.1" "${tree}/usr/share/doc/changelog.Debian"
       "${tree}/usr/share/doc/*/changelog.Debian")
  foreach(text IN LISTS texts)
    execute_process(COMMAND gzip -9nf "${text}" COMMAND_ERROR_IS_FATAL ANY)
  endforeach()
endforeach()
