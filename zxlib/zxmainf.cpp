// zxmainf.cpp - start-up and shutdown.
// Tests: tests/zxlib/zxmainf_test.cpp.
#include "zxmainf.h"

#include <cstdlib>

#include "zxpkg.h"
#include "zxplat.h"
#include "zxsfmt.h"
#include "zxstkdmp.h"
#include "zxstrm.h"
#include "zxsys2.h"

constinit zxStr program_path;
constinit zxStr program_name;
constinit zxStr program_version;
constinit zxStr current_dir;
constinit zxQVA<zxStr> g_args;

namespace {

bool not_yet_started = true;

constexpr std::int32_t k_max_name = 20;

ZxPackage package_record = {"zx", "3.64b", "test w32  vc", 0, nullptr};
[[maybe_unused]] const bool package_registered =
    (register_package(&package_record), true);

// ---- what the failure core and the stack dump ask for

const char* path_for_core() { return program_path.c_str(); }
const char* name_for_core() { return program_name.c_str(); }
const char* version_for_core() { return program_version.c_str(); }

// Behind what was printed before, and past the stream's buffer: the heap
// that it would be taken from may be what failed.
void print_for_core(std::string_view text) {
  zx_standard_stream(zxplat::k_stdout_fd).flush();
  bail_print_directly(text);
}

const char* directory_for_dump() { return current_dir.c_str(); }

void describe_for_dump(const zxFrameMarker& marker, zxText& out) {
  const zxStr text = marker.describe();
  out.add(text.view());
}

void fill_hooks() {
  bail_hooks.program_path = path_for_core;
  bail_hooks.program_name = name_for_core;
  bail_hooks.program_version = version_for_core;
  bail_hooks.print = print_for_core;
  stack_dump_hooks.directory = directory_for_dump;
  stack_dump_hooks.close_files = zxStream::close_all;
  stack_dump_hooks.describe = describe_for_dump;
}

// ---- program values

bool has_ending(const zxStr& text, std::string_view ending) {
  return text.view().ends_with(ending);
}

// The name that the program goes by, from an upper-cased file name.
zxStr name_from_file(zxStr name) {
  name.to_upper();
  if (has_ending(name, ".EXE") || has_ending(name, ".DLL"))
    name.set_length(name.length() - 4);
  if (name.length() > k_max_name) name.set_length(k_max_name);
  return name;
}

void set_program_values(const char* path) {
  program_path = path;
  program_version = program_version_text ? program_version_text : "v0";
  if (!program_path.is_empty())
    program_name = name_from_file(file_part(program_path));
  current_dir = with_slash(get_cwd());
}

void bind_standard_streams() {
  const zxStr name = "-";
  g_stdin.attach(name, zx_standard_stream(zxplat::k_stdin_fd));
  g_stdout.attach(name, zx_standard_stream(zxplat::k_stdout_fd));
  g_stderr.attach(name, zx_standard_stream(zxplat::k_stderr_fd));
}

// Leaves a standard stream written down and empty, and the descriptor as a
// program without the library has it.
void let_go(zxBFile& file, zxplat::Fd descriptor) {
  zxStream& stream = zx_standard_stream(descriptor);
  file.close();
  stream.flush();  // another object may have written to it
  stream.drop_buffer();
  zxplat::files.set_mode(descriptor, zxplat::StreamMode::text);
}

// The order of clearing is fixed; other modules join it here.
void clear_at_exit() {
  program_path.clear();
  program_version.clear();
  current_dir.clear();
  program_name.clear();
  g_args.clear();
  flush_regex_cache();
  clear_temp_path();
  let_go(g_stdin, zxplat::k_stdin_fd);
  let_go(g_stdout, zxplat::k_stdout_fd);
  let_go(g_stderr, zxplat::k_stderr_fd);
  // Files that were open when a failure or the usage screen ended the process.
  zxStream::flush_all();
  // The strings of a module that are destroyed still later.
  if ((traits & k_trait_executable) == 0) zx_realloc = zx_realloc_after_cleanup;
}

}  // namespace

void init_zxlib_args(int argc, const char* const* argv) {
  if (!not_yet_started) return bailf("init_zxlib called twice");
  not_yet_started = false;
  zxplat::prepare_process();
  std::atexit(clear_at_exit);
  fill_hooks();
  zx_is_started = true;
  zx_fmt_program = {&g_args, &program_path, &program_name};
  set_program_values(argc > 0 && argv[0] != nullptr ? argv[0] : "");
  for (int i = 1; i < argc; ++i) g_args.append(argv[i]);
  bind_standard_streams();
}
