# The compiler settings that every target of the project shares.

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

# Objects carry their kind in a byte, so run-time type information would only add weight.
add_compile_options($<$<COMPILE_LANGUAGE:CXX>:-fno-rtti>)

# Clang does not tell memory's size when it is given back unless asked to; GCC always does.
if(CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  add_compile_options($<$<COMPILE_LANGUAGE:CXX>:-fsized-deallocation>)
endif()

if(XQUERY_SANITIZE)
  # The check of virtual tables needs run-time type information.
  add_compile_options(-fsanitize=${XQUERY_SANITIZE} -fno-sanitize-recover=all -fno-sanitize=vptr)
  add_link_options(-fsanitize=${XQUERY_SANITIZE})
endif()

if(XQUERY_BUILD_FUZZ)
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()

add_library(xquery_warnings INTERFACE)
# -Wrestrict is off because GCC 12 reports it for its own string concatenation when optimising.
target_compile_options(xquery_warnings INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wcast-qual -Wextra-semi -Wnon-virtual-dtor
  -Wundef -Wunused -Wvla $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict> $<$<BOOL:${XQUERY_WERROR}>:-Werror>)
