// tempdir.h - the test kit: a folder for one test, and files as exact bytes.
#ifndef KIT_TEMPDIR_H
#define KIT_TEMPDIR_H

#include <string>
#include <string_view>
#include <vector>

namespace kit {

// A fresh folder in the system's temporary folder.  It goes at the end with
// all that is in it by then, read-only files included.
class TempDir {
 public:
  // Throws std::filesystem::filesystem_error if there is no making one.
  TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;
  ~TempDir();

  // The folder, without a final separator; a name for the library as well as
  // for std::filesystem.
  const std::string& path() const { return folder; }

  // The name of a file in it, which need not exist.
  std::string file(std::string_view name) const;

 private:
  std::string folder;
};

// Another working folder until the end of the block.
class WorkingIn {
 public:
  explicit WorkingIn(const std::string& folder);
  WorkingIn(const WorkingIn&) = delete;
  WorkingIn& operator=(const WorkingIn&) = delete;
  ~WorkingIn();

 private:
  std::string before;
};

// A file's bytes.  Throws std::runtime_error if it cannot be read.
std::string read_file(const std::string& path);

// Makes the file, or replaces what is in it.  Throws std::runtime_error if
// that fails.
void write_file(const std::string& path, std::string_view bytes);

// The names in a folder, sorted.
std::vector<std::string> names_in(const std::string& folder);

// Takes all permission to write from a file.
void make_read_only(const std::string& path);

// True if its owner has none.
bool is_read_only(const std::string& path);

}  // namespace kit

#endif  // KIT_TEMPDIR_H
