// faults.cpp - making the n-th system call of a kind fail.
#include "kit/faults.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <sstream>

namespace kit {
namespace {

constexpr std::array<const char*, k_calls> k_names = {
    "open",        "read",          "write",  "flush",     "seek",   "size",
    "set_size",    "lock",          "unlock", "close",     "rename", "remove",
    "make_folder", "remove_folder", "bind",   "disk_space"};

struct Plan {
  int calls = 0;
  int first_failing = 0;  // 0 for none
  int last_failing = 0;
  int error = 0;
};
std::array<Plan, k_calls> plans;
std::size_t write_limit = SIZE_MAX;

Plan& plan_of(Call call) { return plans[static_cast<std::size_t>(call)]; }

// Counts a call; true, with the error set, if it is to fail.
bool fails(Call call) {
  Plan& plan = plan_of(call);
  ++plan.calls;
  if (plan.first_failing == 0 || plan.calls < plan.first_failing ||
      plan.calls > plan.last_failing)
    return false;
  zxplat::set_last_error(plan.error);
  return true;
}

const zxplat::FileCalls& real() { return zxplat::system_files; }

const zxplat::FileCalls k_failing = {
    .open =
        [](std::string_view name, zxplat::OpenMode mode) {
          return fails(Call::open) ? zxplat::k_no_fd : real().open(name, mode);
        },
    .read =
        [](zxplat::Fd fd, void* buffer, std::size_t size) {
          return fails(Call::read) ? std::int64_t{-1}
                                   : real().read(fd, buffer, size);
        },
    .write =
        [](zxplat::Fd fd, const void* bytes, std::size_t size) {
          return fails(Call::write)
                     ? std::int64_t{-1}
                     : real().write(fd, bytes, std::min(size, write_limit));
        },
    .seek =
        [](zxplat::Fd fd, std::int64_t offset, zxplat::Whence whence) {
          return fails(Call::seek) ? std::int64_t{-1}
                                   : real().seek(fd, offset, whence);
        },
    .flush =
        [](zxplat::Fd fd) { return !fails(Call::flush) && real().flush(fd); },
    .size =
        [](zxplat::Fd fd) {
          return fails(Call::size) ? std::int64_t{-1} : real().size(fd);
        },
    .set_size =
        [](zxplat::Fd fd, std::int64_t size) {
          return !fails(Call::set_size) && real().set_size(fd, size);
        },
    .lock =
        [](zxplat::Fd fd, std::int64_t start, std::int64_t size) {
          return !fails(Call::lock) && real().lock(fd, start, size);
        },
    .unlock =
        [](zxplat::Fd fd, std::int64_t start, std::int64_t size) {
          return !fails(Call::unlock) && real().unlock(fd, start, size);
        },
    .set_mode =
        [](zxplat::Fd fd, zxplat::StreamMode mode) {
          return real().set_mode(fd, mode);
        },
    .close =
        [](zxplat::Fd fd) {
          const bool closed = real().close(fd);
          return !fails(Call::close) && closed;
        },
    .rename =
        [](std::string_view from, std::string_view to) {
          if (!fails(Call::rename)) return real().rename(from, to);
          return zxplat::last_error() == zxplat::k_err_other_device
                     ? zxplat::RenameResult::other_device
                     : zxplat::RenameResult::failed;
        },
    .remove =
        [](std::string_view name) {
          return !fails(Call::remove) && real().remove(name);
        },
    .make_folder =
        [](std::string_view name) {
          return !fails(Call::make_folder) && real().make_folder(name);
        },
    .remove_folder =
        [](std::string_view name) {
          return !fails(Call::remove_folder) && real().remove_folder(name);
        },
    .bind =
        [](zxplat::Fd from, zxplat::Fd to) {
          return !fails(Call::bind) && real().bind(from, to);
        },
    .disk_space =
        [](char letter, zxplat::DiskSpace& space) {
          return !fails(Call::disk_space) && real().disk_space(letter, space);
        },
};

}  // namespace

const char* name_of(Call call) {
  return k_names[static_cast<std::size_t>(call)];
}

Faults::Faults() {
  plans = {};
  write_limit = SIZE_MAX;
  zxplat::files = k_failing;
}

Faults::~Faults() { zxplat::files = zxplat::system_files; }

void Faults::fail_nth(Call call, int n, int error) {
  Plan& plan = plan_of(call);
  plan.first_failing = plan.last_failing = plan.calls + n;
  plan.error = error;
}

void Faults::fail_all(Call call, int error) {
  fail_nth(call, 1, error);
  plan_of(call).last_failing = INT32_MAX;
}

void Faults::limit_writes(std::size_t bytes) { write_limit = bytes; }

int Faults::count(Call call) const { return plan_of(call).calls; }

bool Faults::parse(const std::string& wish) {
  std::istringstream in(wish);
  std::string name;
  int n = 0;
  int error = zxplat::k_err_io;
  char colon = ':';
  if (!std::getline(in, name, ':') || !(in >> n) || n < 1) return false;
  if (in >> colon && !(in >> error)) return false;
  const auto* found = std::find(k_names.begin(), k_names.end(), name);
  if (found == k_names.end()) return false;
  fail_nth(static_cast<Call>(found - k_names.begin()), n, error);
  return true;
}

}  // namespace kit
