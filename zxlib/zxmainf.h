// zxmainf.h - start-up and shutdown, and the values that they set for the
// whole process.
//
// An application defines `traits` and `int zx_main()`, and if it wants them
// `usage_text` and `program_version_text`, and links the entry object of its
// kind (zxlib_console).  That object holds the real main(): it starts the
// library and calls zx_main(), whose result is the exit code.
//
//   #include "zxmainf.h"
//   std::uint32_t traits = k_trait_console | k_trait_executable;
//   int zx_main() { ... return 0; }
//
// At the end of the process the library's exit handler clears all of this
// and flushes the standard streams; a failure behind it shows empty names.
#ifndef ZXMAINF_H
#define ZXMAINF_H

#include <cstdint>

#include "zxbfile.h"
#include "zxqva.h"
#include "zxstr.h"

// ---- defined by the application

// The program behind the library's start.
int zx_main();

// The text of the usage screen; null for none.
extern const char* usage_text;

// The version, usually stored by the constructor of a static object; null
// shows as "v0".
extern const char* program_version_text;

// ---- set by start-up

extern zxStr program_path;     // the first argument as given
extern zxStr program_name;     // its file name in upper case, without .EXE
                               // or .DLL, at most 20 characters
extern zxStr program_version;  // program_version_text or "v0"
extern zxStr current_dir;      // the working directory, ending in a backslash
extern zxQVA<zxStr> g_args;    // the arguments behind the program's name;
                               // init_opts() takes options off its front

// Positional argument n, or the empty string.
inline const zxStr& positional_arg(std::int32_t n) { return g_args.get_or(n); }

// Starts the library: registers its exit handler, stores the values above
// and binds the standard streams.  A second call is fatal.  An argument list
// without a program name gives empty texts.
void init_zxlib_args(int argc, const char* const* argv);

#endif  // ZXMAINF_H
