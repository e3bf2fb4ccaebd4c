// files.cpp - the program that times the file class beside its peers.
// bench/groups/files.py runs it and says what is compared.
//
// Benchmarks are named WHAT/SIDE, SIDE being "ours" or "peer".  One iteration
// goes through a whole file that the program makes for itself, and one
// operation is a line of it; the file is in the system's cache by then.
#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>

#include "zxbfile.h"
#include "zxmainf.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

namespace {

using benchmark::DoNotOptimize;

constexpr std::size_t k_file_size = 100'000'000;

// ---- the file

// Lengths as text files have them: most lines short or empty, some a
// paragraph, and now and then one that no buffer holds.
std::size_t mixed_length(std::mt19937& random) {
  const std::size_t kind = random() % 1000;
  if (kind == 0) return random() % 200'000;
  if (kind < 50) return random() % 3000;
  return random() % 120;
}

// Lines of settings and lists: what a line costs counts, not its bytes.
std::size_t short_length(std::mt19937& random) { return random() % 50; }

// A file of its own in the folder for temporary files, up to the end of the
// program.
class LinesFile {
 public:
  explicit LinesFile(std::size_t (*random_length)(std::mt19937&)) {
    std::mt19937 random(1);
    std::string text;
    while (text.size() < k_file_size) {
      text.append(random_length(random), static_cast<char>('a' + lines % 26));
      text += '\n';
      ++lines;
    }
    std::ofstream(name, std::ios::binary) << text;
  }
  LinesFile(const LinesFile&) = delete;
  LinesFile& operator=(const LinesFile&) = delete;
  ~LinesFile() { std::filesystem::remove(name); }

  const std::string name =
      (std::filesystem::temp_directory_path() /
       ("bench_files_" + std::to_string(std::random_device()())))
          .string();
  std::size_t lines = 0;
};

const LinesFile& mixed_file() {
  static const LinesFile file(mixed_length);
  return file;
}

const LinesFile& short_file() {
  static const LinesFile file(short_length);
  return file;
}

// ---- reading it line by line: a function for each side, the number of lines

std::size_t read_by_gets(const char* name) {
  zxBFile file;
  file.open_or_die(name);
  zxStr line;
  std::size_t count = 0;
  for (; file.gets(line); ++count) DoNotOptimize(line.c_str());
  return count;
}

std::size_t read_by_c(const char* name) {
  std::FILE* file = std::fopen(name, "rb");
  if (file == nullptr) return 0;
  char* line = nullptr;
  std::size_t room = 0;
  std::size_t count = 0;
  for (; getline(&line, &room, file) >= 0; ++count) DoNotOptimize(line);
  std::free(line);
  std::fclose(file);
  return count;
}

std::size_t read_by_std(const char* name) {
  std::ifstream file(name, std::ios::binary);
  std::string line;
  std::size_t count = 0;
  for (; std::getline(file, line); ++count) DoNotOptimize(line.data());
  return count;
}

void read_lines(benchmark::State& state, const LinesFile& (*lines_file)(),
                std::size_t (*read)(const char*)) {
  const LinesFile& file = lines_file();
  for (auto _ : state) {
    if (read(file.name.c_str()) == file.lines) continue;
    state.SkipWithError("lines are missing");
    break;
  }
  state.counters["operations"] = static_cast<double>(file.lines);
}

void register_rows(const std::string& lines, const LinesFile& (*file)()) {
  const struct {
    const char* side;
    std::size_t (*read)(const char*);
  } sides[] = {{"_c/ours", read_by_gets},
               {"_c/peer", read_by_c},
               {"_std/ours", read_by_gets},
               {"_std/peer", read_by_std}};
  for (const auto& one : sides)
    benchmark::RegisterBenchmark((lines + one.side).c_str(), read_lines, file,
                                 one.read);
}

}  // namespace

int main(int argc, char** argv) {
  init_zxlib_args(1, argv);
  register_rows("mixed", mixed_file);
  register_rows("short", short_file);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
