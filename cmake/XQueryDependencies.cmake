# Third-party libraries, gathered behind one interface target. The packages that provide them on
# Debian are listed in cmake/debian-packages.txt.

find_package(PkgConfig REQUIRED)
find_package(Threads REQUIRED)
find_package(LibXml2 REQUIRED)
find_package(ICU REQUIRED COMPONENTS uc i18n)
find_package(ZLIB REQUIRED)
find_package(LibLZMA REQUIRED)
find_package(BZip2 REQUIRED)
pkg_check_modules(XSLT REQUIRED IMPORTED_TARGET libxslt)
pkg_check_modules(GMP REQUIRED IMPORTED_TARGET gmp)
pkg_check_modules(CURL REQUIRED IMPORTED_TARGET libcurl)
pkg_check_modules(TIDY REQUIRED IMPORTED_TARGET tidy)
pkg_check_modules(PCRE2 REQUIRED IMPORTED_TARGET libpcre2-8)
pkg_check_modules(ZSTD REQUIRED IMPORTED_TARGET libzstd)
pkg_check_modules(HWY REQUIRED libhwy)  # its headers only

add_library(xquery_dependencies INTERFACE)
target_link_libraries(xquery_dependencies INTERFACE
  LibXml2::LibXml2 PkgConfig::XSLT ICU::i18n ICU::uc PkgConfig::GMP PkgConfig::PCRE2
  PkgConfig::CURL PkgConfig::TIDY ZLIB::ZLIB LibLZMA::LibLZMA PkgConfig::ZSTD BZip2::BZip2
  Threads::Threads)
