// pages.h - the test kit: the pages in docs/, for tests of their examples.
#ifndef KIT_PAGES_H
#define KIT_PAGES_H

#include <string>
#include <vector>

namespace kit {

// The path of a file of the project.  A test fails if the environment variable
// ZX_SOURCE_DIR does not tell where that is.
std::string source(const std::string& name);

// The lines of such a file.
std::vector<std::string> lines_of(const std::string& name);

// The cells of the rows of a page's tables, without back quotes and without
// blanks at their ends.
std::vector<std::vector<std::string>> rows_in(const std::string& page);

// The indented lines of a page, as they would stand in a file or on a screen.
std::string indented_in(const std::string& page);

}  // namespace kit

#endif  // KIT_PAGES_H
