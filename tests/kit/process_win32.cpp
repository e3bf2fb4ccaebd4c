// process_win32.cpp - see process.h.

#include <windows.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <stdexcept>
#include <string_view>

#include "process.h"

namespace kit {
namespace {

void require(bool is_good, const std::string& what) {
  if (is_good) return;
  throw std::runtime_error(what + ": error " + std::to_string(GetLastError()));
}

// A handle of the system, given back at the end of the block.
class Handle {
 public:
  explicit Handle(HANDLE owned = nullptr) : handle(owned) {}
  Handle(const Handle&) = delete;
  Handle& operator=(const Handle&) = delete;
  ~Handle() { close(); }

  void close() {
    if (handle != nullptr) CloseHandle(handle);
    handle = nullptr;
  }

  HANDLE handle;
};

// A pipe of which the child gets one end and keeps it alone.
struct Pipe {
  Handle read;
  Handle write;

  void make(Handle Pipe::*ours) {
    SECURITY_ATTRIBUTES inherited = {sizeof inherited, nullptr, TRUE};
    require(CreatePipe(&read.handle, &write.handle, &inherited, 0), "pipe");
    SetHandleInformation((this->*ours).handle, HANDLE_FLAG_INHERIT, 0);
  }
};

// -- the command line --

bool needs_quotes(const std::string& word) {
  return word.empty() || word.find_first_of(" \t\n\v\"") != word.npos;
}

// Backslashes stand for themselves unless a quote follows them.
std::string quoted(const std::string& word) {
  if (!needs_quotes(word)) return word;
  std::string text = "\"";
  std::size_t backslashes = 0;
  for (const char c : word) {
    if (c == '"') text.append(backslashes + 1, '\\');
    backslashes = c == '\\' ? backslashes + 1 : 0;
    text += c;
  }
  text.append(backslashes, '\\');
  return text + '"';
}

std::string command_line(const std::vector<std::string>& command) {
  std::string line;
  for (const std::string& word : command) {
    if (!line.empty()) line += ' ';
    line += quoted(word);
  }
  return line;
}

// -- the environment --

bool is_variable(std::string_view entry, std::string_view name) {
  const auto alike = [](unsigned char a, unsigned char b) {
    return std::toupper(a) == std::toupper(b);
  };
  return entry.size() > name.size() && entry[name.size()] == '=' &&
         std::equal(name.begin(), name.end(), entry.begin(), alike);
}

std::vector<std::string> own_environment() {
  std::vector<std::string> entries;
  char* const block = GetEnvironmentStringsA();
  require(block != nullptr, "environment");
  for (const char* entry = block; *entry != '\0';) {
    entries.emplace_back(entry);
    entry += entries.back().size() + 1;
  }
  FreeEnvironmentStringsA(block);
  return entries;
}

void remove_variable(std::vector<std::string>& entries,
                     const std::string& name) {
  std::erase_if(entries, [&](const std::string& entry) {
    return is_variable(entry, name);
  });
}

std::string environment_block(const ProcessOptions& options) {
  std::vector<std::string> entries = own_environment();
  for (const auto& [name, value] : options.variables) {
    remove_variable(entries, name);
    entries.push_back(name);
    entries.back().append("=").append(value);
  }
  for (const std::string& name : options.removed_variables) {
    remove_variable(entries, name);
  }
  std::string block;
  for (const std::string& entry : entries) block += entry + '\0';
  return block + '\0';
}

// -- the streams; each is served by a thread --

struct Input {
  HANDLE pipe;
  const std::string& text;
};

struct Output {
  HANDLE pipe;
  std::string& text;
};

// A program that reads no more ends the writing.
DWORD WINAPI send(void* argument) {
  const auto* input = static_cast<const Input*>(argument);
  std::string_view rest = input->text;
  DWORD count = 0;
  while (!rest.empty() &&
         WriteFile(input->pipe, rest.data(), static_cast<DWORD>(rest.size()),
                   &count, nullptr)) {
    rest.remove_prefix(count);
  }
  CloseHandle(input->pipe);
  return 0;
}

DWORD WINAPI receive(void* argument) {
  const auto* output = static_cast<const Output*>(argument);
  char buffer[16384];
  DWORD count = 0;
  while (ReadFile(output->pipe, buffer, sizeof buffer, &count, nullptr) &&
         count != 0) {
    output->text.append(buffer, count);
  }
  return 0;
}

HANDLE started(LPTHREAD_START_ROUTINE routine, void* argument) {
  const HANDLE thread = CreateThread(nullptr, 0, routine, argument, 0, nullptr);
  require(thread != nullptr, "thread");
  return thread;
}

// -- the process --

// One run.  The job holds the process and all that it starts.
class Run {
 public:
  Run(const std::vector<std::string>& command, const ProcessOptions& wanted)
      : options(wanted), job(CreateJobObjectA(nullptr, nullptr)) {
    in.make(&Pipe::write);
    out.make(&Pipe::read);
    err.make(&Pipe::read);
    start(command);
    in.read.close();
    out.write.close();
    err.write.close();
  }

  ProcessResult finish() {
    Input input = {in.write.handle, options.input};
    Output output = {out.read.handle, result.out};
    Output errors = {err.read.handle, result.err};
    in.write.handle = nullptr;  // the thread closes it
    const Handle sender(started(send, &input));
    const Handle out_reader(started(receive, &output));
    const Handle err_reader(started(receive, &errors));
    wait_for(
        {process.handle, sender.handle, out_reader.handle, err_reader.handle});
    DWORD code = 0;
    GetExitCodeProcess(process.handle, &code);
    result.exit_code = static_cast<int>(code);
    return result;
  }

 private:
  STARTUPINFOA startup() const {
    STARTUPINFOA info = {};
    info.cb = sizeof info;
    info.dwFlags = STARTF_USESTDHANDLES;
    const unsigned missing = options.missing;
    if ((missing & k_no_input) == 0) info.hStdInput = in.read.handle;
    if ((missing & k_no_output) == 0) info.hStdOutput = out.write.handle;
    if ((missing & k_no_errors) == 0) info.hStdError = err.write.handle;
    return info;
  }

  // The process runs only once it belongs to the job.
  void start(const std::vector<std::string>& command) {
    std::string line = command_line(command);
    std::string environment = environment_block(options);
    const char* const directory =
        options.directory.empty() ? nullptr : options.directory.c_str();
    STARTUPINFOA info = startup();
    PROCESS_INFORMATION made = {};
    require(CreateProcessA(nullptr, line.data(), nullptr, nullptr, TRUE,
                           CREATE_SUSPENDED, environment.data(), directory,
                           &info, &made),
            command.at(0));
    process.handle = made.hProcess;
    AssignProcessToJobObject(job.handle, process.handle);
    ResumeThread(made.hThread);
    CloseHandle(made.hThread);
  }

  // Waits for the process and its streams; past the limit the whole job is
  // killed, which ends the streams as well.
  void wait_for(const std::array<HANDLE, 4>& all) {
    const auto limit = static_cast<DWORD>(options.limit.count());
    const auto count = static_cast<DWORD>(all.size());
    if (WaitForMultipleObjects(count, all.data(), TRUE, limit) !=
        WAIT_TIMEOUT) {
      return;
    }
    result.timed_out = true;
    TerminateJobObject(job.handle, static_cast<UINT>(-9));
    WaitForMultipleObjects(count, all.data(), TRUE, INFINITE);
  }

  const ProcessOptions& options;
  Handle job;
  Handle process;
  Pipe in;
  Pipe out;
  Pipe err;
  ProcessResult result;
};

}  // namespace

ProcessResult run_process(const std::vector<std::string>& command,
                          const ProcessOptions& options) {
  return Run(command, options).finish();
}

std::string self_path() {
  std::string path(32768, '\0');
  path.resize(GetModuleFileNameA(nullptr, path.data(),
                                 static_cast<DWORD>(path.size())));
  return path;
}

}  // namespace kit
