// file_model.h - a file as a string and a position, for tests that compare
// streams with it.
#ifndef FILE_MODEL_H
#define FILE_MODEL_H

#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>

struct FileModel {
  std::string bytes = {};
  std::size_t at = 0;
  bool met_end = false;

  std::string read(std::size_t size) {
    const std::size_t start = std::min(at, bytes.size());
    const std::string got = bytes.substr(start, size);
    at += got.size();
    if (got.size() < size) met_end = true;
    return got;
  }

  void write(std::string_view text) {
    if (text.empty()) return;
    if (bytes.size() < at + text.size()) bytes.resize(at + text.size());
    bytes.replace(at, text.size(), text);
    at += text.size();
  }

  void seek(std::size_t place) {
    at = place;
    met_end = false;
  }
};

#endif  // FILE_MODEL_H
