// zxplat_win32_folders.cpp - folders, their entries and the disk, for Windows.
// Tested by tests/zxlib/zxplat_folders_test.cpp.

#include <windows.h>

#include <cstring>
#include <new>

#include "zxplat_impl.h"
#include "zxplat_win32_impl.h"

namespace zxplat {
namespace {

using common::is_dots;
using win32::Attempt;
using win32::fail_with;
using win32::Name;
using win32::to_name;

bool is_letter(char c) {
  return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}

constexpr bool is_slash(char c) { return c == '\\' || c == '/'; }

// The pattern of all entries of a folder.
bool to_pattern(std::string_view folder, Name& pattern) {
  if (folder.empty()) return to_name("*", pattern);
  if (folder.size() > k_max_name - 2) return fail_with(k_err_bad_name);
  if (!to_name(folder, pattern)) return false;
  const char last = folder.back();
  const bool is_closed = is_slash(last) || (folder.size() == 2 && last == ':');
  std::strcpy(pattern.text + folder.size(), is_closed ? "*" : "\\*");
  return true;
}

// The system puts a question mark for what its code page does not have.
bool is_usable(std::string_view name) {
  return name.find('?') == name.npos && !is_null_device(name);
}

using Data = WIN32_FIND_DATAA;

}  // namespace

namespace win32 {

bool make_folder(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::CreateDirectoryA(text.text, nullptr) != 0);
}

bool remove_folder(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::RemoveDirectoryA(text.text) != 0);
}

bool disk_space(char letter, DiskSpace& space) {
  const char root[] = {letter, ':', '\\', '\0'};
  if (letter != '\0' && !is_letter(letter))
    return fail_with(k_err_path_not_found);
  const Attempt attempt;
  DWORD sectors = 0;
  DWORD bytes = 0;
  DWORD available = 0;
  DWORD all = 0;
  const bool is_known =
      ::GetDiskFreeSpaceA(letter == '\0' ? nullptr : root, &sectors, &bytes,
                          &available, &all) != 0;
  if (is_known) space = {available, sectors, bytes};
  return attempt.settle(is_known);
}

}  // namespace win32

bool is_volume(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::GetVolumeInformationA(text.text, nullptr, 0, nullptr,
                                                nullptr, nullptr, nullptr,
                                                0) != 0);
}

bool set_current_directory(std::string_view name) {
  Name text;
  if (!to_name(name, text)) return false;
  const Attempt attempt;
  return attempt.settle(::SetCurrentDirectoryA(text.text) != 0);
}

// The system delivers the first entry with the handle: until it is asked
// for, `size` is not 0.
FolderReader::FolderReader(std::string_view folder)
    : handle(reinterpret_cast<std::intptr_t>(INVALID_HANDLE_VALUE)) {
  static_assert(sizeof(Data) <= sizeof room && alignof(Data) <= 8);
  Name pattern;
  if (!to_pattern(folder, pattern)) return;
  const Attempt attempt;
  const HANDLE found = ::FindFirstFileA(pattern.text, ::new (room) Data);
  const bool is_open = found != INVALID_HANDLE_VALUE;
  if (is_open) size = sizeof(Data);
  handle = reinterpret_cast<std::intptr_t>(found);
  attempt.settle(is_open);
}

FolderReader::~FolderReader() {
  const auto search = reinterpret_cast<HANDLE>(handle);
  if (search != INVALID_HANDLE_VALUE) ::FindClose(search);
}

bool FolderReader::next(FolderEntry& entry) {
  const auto search = reinterpret_cast<HANDLE>(handle);
  if (search == INVALID_HANDLE_VALUE) return false;
  Data& data = *std::launder(reinterpret_cast<Data*>(room));
  const Attempt attempt;
  do {
    if (size == 0 && !::FindNextFileA(search, &data)) {
      attempt.restore();
      return false;
    }
    size = 0;
  } while (is_dots(data.cFileName) || !is_usable(data.cFileName));
  attempt.restore();
  entry = {data.cFileName,
           (data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0,
           (data.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0};
  return true;
}

}  // namespace zxplat
