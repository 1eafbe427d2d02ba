# Writes a header with the parts of the profile's page as texts:
#   cmake -DRESULT=HEADER -DFOLDER=FOLDER -P EmbedPage.cmake
# The texts stand between marks that none of the files holds, in pieces no longer than compilers
# must take.

function(text_of file name result)
  file(READ "${file}" text)
  if(text MATCHES "\\)page\"")
    message(FATAL_ERROR "${file} holds the mark that ends a text")
  endif()
  string(LENGTH "${text}" length)
  set(pieces "")
  set(from 0)
  while(from LESS length)
    string(SUBSTRING "${text}" ${from} 8000 piece)
    string(APPEND pieces "\n    R\"page(${piece})page\"")
    math(EXPR from "${from} + 8000")
  endwhile()
  set(${result} "inline constexpr const char* ${name} =${pieces};\n" PARENT_SCOPE)
endfunction()

text_of("${FOLDER}/page.html" XQueryProfilePageFrame frame)
text_of("${FOLDER}/page.css" XQueryProfilePageStyle style)
text_of("${FOLDER}/page.js" XQueryProfilePageScript script)
file(WRITE "${RESULT}"
  "// Made of src/Plan/Profile/page.*\n#pragma once\n\nnamespace xquery {\n\n"
  "${frame}\n${style}\n${script}\n}  // namespace xquery\n")
