# The CMakeLists.txt of a program that uses the installed package.
cmake_minimum_required(VERSION 3.25)
project(consumer LANGUAGES CXX)
find_package(xquery REQUIRED)
add_executable(embed embed.cpp)
target_link_libraries(embed PRIVATE xquery::xquery)
