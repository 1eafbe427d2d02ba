# The CMakeLists.txt of a program in C that uses the installed package.
cmake_minimum_required(VERSION 3.25)
project(consumer LANGUAGES C)
find_package(xquery REQUIRED)
add_executable(embed embed.c)
target_link_libraries(embed PRIVATE xquery::xquery)
