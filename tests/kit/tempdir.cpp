// tempdir.cpp - see tempdir.h.

#include "tempdir.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <stdexcept>
#include <system_error>

namespace kit {
namespace {

namespace fs = std::filesystem;

std::string fresh_name() {
  std::random_device random;
  return "zxkit-" + std::to_string(random());
}

// Some systems do not delete what may not be written to.
void unprotect(const fs::path& folder) {
  std::error_code ignored;
  for (const auto& entry : fs::recursive_directory_iterator(folder, ignored)) {
    if (entry.is_symlink(ignored)) continue;
    fs::permissions(entry.path(), fs::perms::owner_write, fs::perm_options::add,
                    ignored);
  }
}

}  // namespace

TempDir::TempDir() {
  const fs::path place = fs::temp_directory_path();
  fs::path path = place / fresh_name();
  while (!fs::create_directory(path)) path = place / fresh_name();
  folder = path.string();
}

TempDir::~TempDir() {
  std::error_code ignored;
  unprotect(folder);
  fs::remove_all(folder, ignored);
}

std::string TempDir::file(std::string_view name) const {
  return (fs::path(folder) / fs::path(name)).string();
}

WorkingIn::WorkingIn(const std::string& folder)
    : before(fs::current_path().string()) {
  fs::current_path(folder);
}

WorkingIn::~WorkingIn() { fs::current_path(before); }

std::string read_file(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) throw std::runtime_error("cannot open " + path);
  std::string bytes{std::istreambuf_iterator<char>(in),
                    std::istreambuf_iterator<char>()};
  if (in.bad()) throw std::runtime_error("cannot read " + path);
  return bytes;
}

void write_file(const std::string& path, std::string_view bytes) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  out.close();
  if (!out) throw std::runtime_error("cannot write " + path);
}

std::vector<std::string> names_in(const std::string& folder) {
  std::vector<std::string> names;
  for (const auto& entry : fs::directory_iterator(folder))
    names.push_back(entry.path().filename().string());
  std::sort(names.begin(), names.end());
  return names;
}

void make_read_only(const std::string& path) {
  constexpr fs::perms k_write =
      fs::perms::owner_write | fs::perms::group_write | fs::perms::others_write;
  fs::permissions(path, k_write, fs::perm_options::remove);
}

bool is_read_only(const std::string& path) {
  return (fs::status(path).permissions() & fs::perms::owner_write) ==
         fs::perms::none;
}

}  // namespace kit
