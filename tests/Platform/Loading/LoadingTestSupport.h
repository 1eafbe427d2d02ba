// A folder of its own for each test, and loading in few words.
#pragma once

#include "Platform/Loading/NSURLLoader.h"

#include <gtest/gtest.h>

#include <cctype>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <unistd.h>

namespace xquery {

// The URL of the file or folder of that path, whatever characters it has.
inline std::string fileURL(const std::string& path) {
  constexpr std::string_view plain = "/-._~";
  std::string URL = "file://";
  for (const unsigned char byte : path) {
    char escaped[4];
    std::snprintf(escaped, sizeof escaped, "%%%02X", byte);
    const bool isPlain =
        byte < 0x80 && (std::isalnum(byte) || plain.find(static_cast<char>(byte)) != plain.npos);
    URL += isPlain ? std::string(1, static_cast<char>(byte)) : escaped;
  }
  return URL;
}

class TestFolder {
 public:
  TestFolder()
      : _path(std::filesystem::canonical(std::filesystem::temp_directory_path()) /
              ("xquery-test-" + std::to_string(::getpid()) + "-" + std::to_string(_count++))) {
    std::filesystem::create_directories(_path);
  }
  ~TestFolder() { std::filesystem::remove_all(_path); }
  TestFolder(const TestFolder&) = delete;
  TestFolder& operator=(const TestFolder&) = delete;

  std::string path(const std::string& name = "") const {
    return name.empty() ? _path.string() : (_path / name).string();
  }
  // Writes a file and answers its URL.
  std::string write(const std::string& name, std::string_view text) const {
    std::filesystem::create_directories((_path / name).parent_path());
    std::ofstream(_path / name, std::ios::binary) << text;
    return URL(name);
  }
  // The name is to be written as in a URL.
  std::string URL(const std::string& name) const { return fileURL(path()) + "/" + name; }

 private:
  std::filesystem::path _path;
  static inline int _count = 0;
};

inline Ref<NSURL> URLOf(std::string_view text) {
  return NSURL::URLWithString(NSString::stringWithUTF8(text));
}

// Loads as a document; the data, or "(nothing: why)".
inline std::string loaded(NSURLLoader& loader, std::string_view URL) {
  const auto resource = loader.load(*URLOf(URL), XQueryLoadPurpose::Document);
  return resource ? resource->data : "(nothing: " + loader.failure() + ")";
}
inline std::string loaded(const XQueryLoading& loading, std::string_view URL) {
  return loaded(*NSURLLoader::loaderWithLoading(loading), URL);
}
inline bool isNothing(const std::string& text) {
  return text.starts_with("(nothing: ");
}

}  // namespace xquery
