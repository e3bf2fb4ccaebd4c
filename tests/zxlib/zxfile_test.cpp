// zxfile_test.cpp - the buffered stream: random operations against a model
// of the file, the edges of its buffer, its thrift with system calls, and
// each call of the system failing.
// Tests zxlib/zxfile.h and zxfile.cpp.
#include "zxfile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "file_model.h"
#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "zxbfile.h"
#include "zxmainf.h"
#include "zxmisc.h"
#include "zxsfmt.h"

namespace {

using kit::Call;
using kit::Faults;
using kit::read_file;
using kit::TempDir;
using kit::write_file;
using zxplat::OpenMode;
using zxplat::Whence;

using Sizes = std::vector<std::size_t>;

// Sizes on both sides of every edge that a buffer may have.
constexpr std::size_t k_edges[] = {0,      1,      2,     4095,  4096,
                                   4097,   8192,   65535, 65536, 65537,
                                   131071, 131072, 131073};

// Bytes of which no two stretches of 64 KiB are alike.
std::string pattern(std::size_t size) {
  std::string bytes(size, '\0');
  for (std::size_t i = 0; i < size; ++i)
    bytes[i] = static_cast<char>((i * 7 + i / 251 + i / 65536) & 0xFF);
  return bytes;
}

// A file in a folder of its own.
class TestFile {
 public:
  explicit TestFile(std::string_view bytes) { write_file(name, bytes); }

  std::string bytes() const { return read_file(name); }
  std::size_t size() const { return bytes().size(); }

 private:
  TempDir folder;

 public:
  const std::string name = folder.file("file");
};

// A stream, closed at the end of the block unless that was done.
class Stream {
 public:
  Stream(const std::string& name, OpenMode mode)
      : stream(zxStream::open(name, mode)) {
    EXPECT_NE(stream, nullptr) << zxplat::last_error();
  }
  Stream(const Stream&) = delete;
  Stream& operator=(const Stream&) = delete;
  ~Stream() {
    if (stream != nullptr) zxStream::close(stream);
  }

  zxStream* operator->() const { return stream; }

  std::string read(std::size_t size) const {
    std::string bytes(size, '?');
    const std::size_t count = stream->read(bytes.data(), size);
    EXPECT_LE(count, size);
    bytes.resize(std::min(count, size));
    return bytes;
  }

  bool write(std::string_view bytes) const {
    return stream->write(bytes.data(), bytes.size());
  }

  bool close() {
    zxStream* closing = stream;
    stream = nullptr;
    return zxStream::close(closing);
  }

 private:
  zxStream* stream;
};

// While one lives, it notes the size of each read of the system, and hands
// out at most `most` bytes at once.
class Reads {
 public:
  explicit Reads(std::size_t most_bytes = SIZE_MAX) {
    sizes.clear();
    most = most_bytes;
    zxplat::files.read = [](zxplat::Fd fd, void* buffer, std::size_t size) {
      sizes.push_back(size);
      return zxplat::system_files.read(fd, buffer, std::min(size, most));
    };
  }
  Reads(const Reads&) = delete;
  Reads& operator=(const Reads&) = delete;
  ~Reads() { zxplat::files.read = zxplat::system_files.read; }

  static inline Sizes sizes;

 private:
  static inline std::size_t most;
};

// ---- opening and closing

TEST(zxfile, opening_a_missing_file_gives_null_and_the_reason) {
  const TempDir folder;
  for (const OpenMode mode : {OpenMode::read, OpenMode::read_write}) {
    zxplat::set_last_error(0);
    EXPECT_EQ(zxStream::open(folder.file("none"), mode), nullptr);
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_not_found);
  }
}

TEST(zxfile, a_fresh_stream_is_at_the_start_without_end_and_error) {
  const TestFile file("abc");
  for (const OpenMode mode :
       {OpenMode::read, OpenMode::read_write, OpenMode::create}) {
    Stream stream(file.name, mode);
    EXPECT_EQ(stream->tell(), 0);
    EXPECT_FALSE(stream->eof());
    EXPECT_FALSE(stream->error());
    EXPECT_TRUE(stream.close());
  }
}

TEST(zxfile, an_unused_stream_costs_an_open_and_a_close_alone) {
  const TestFile file("abc");
  const Faults calls;
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_TRUE(stream->flush());
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(calls.count(Call::open), 1);
  EXPECT_EQ(calls.count(Call::close), 1);
  for (const Call call : {Call::read, Call::write, Call::seek, Call::flush})
    EXPECT_EQ(calls.count(call), 0) << kit::name_of(call);
}

TEST(zxfile, the_standard_streams_are_one_for_each_descriptor) {
  for (const zxplat::Fd fd :
       {zxplat::k_stdin_fd, zxplat::k_stdout_fd, zxplat::k_stderr_fd}) {
    EXPECT_EQ(zx_standard_stream(fd).descriptor(), fd);
    EXPECT_EQ(&zx_standard_stream(fd), &zx_standard_stream(fd));
  }
}

// ---- reading

TEST(zxfile, files_of_every_size_are_read_by_pieces_of_every_size) {
  const std::string all = pattern(131073);
  for (const std::size_t size : k_edges) {
    const TestFile file(std::string_view(all).substr(0, size));
    for (const std::size_t piece : k_edges) {
      if (piece == 0 || size / piece > 20'000) continue;
      SCOPED_TRACE(testing::Message() << size << " by " << piece);
      const Stream stream(file.name, OpenMode::read);
      std::string got;
      for (std::size_t i = 0; i <= size / piece; ++i) got += stream.read(piece);
      ASSERT_TRUE(stream->eof());
      ASSERT_TRUE(got == all.substr(0, size));
      ASSERT_FALSE(stream->error());
      ASSERT_EQ(stream->tell(), static_cast<std::int64_t>(size));
    }
  }
}

TEST(zxfile, the_end_is_met_by_a_short_count_only) {
  const TestFile file("abcdef");
  const Stream stream(file.name, OpenMode::read);
  EXPECT_EQ(stream.read(6), "abcdef");
  EXPECT_FALSE(stream->eof());
  EXPECT_EQ(stream.read(0), "");
  EXPECT_FALSE(stream->eof());
  EXPECT_EQ(stream.read(1), "");
  EXPECT_TRUE(stream->eof());
  EXPECT_FALSE(stream->error());
}

TEST(zxfile, a_seek_takes_the_end_back) {
  const TestFile file("abcdef");
  const Stream stream(file.name, OpenMode::read);
  EXPECT_EQ(stream.read(100), "abcdef");
  EXPECT_TRUE(stream->eof());
  EXPECT_TRUE(stream->seek(4, Whence::start));
  EXPECT_FALSE(stream->eof());
  EXPECT_EQ(stream.read(1), "e");
  EXPECT_FALSE(stream->eof());
}

TEST(zxfile, short_reads_of_the_system_are_put_together) {
  const std::string all = pattern(200'000);
  const TestFile file(all);
  for (const std::size_t most : {std::size_t{1000}, std::size_t{4097}}) {
    const Reads few(most);
    const Stream stream(file.name, OpenMode::read);
    EXPECT_TRUE(stream.read(10) == all.substr(0, 10));
    EXPECT_TRUE(stream.read(70'000) == all.substr(10, 70'000));
    EXPECT_TRUE(stream.read(65'536) == all.substr(70'010, 65'536));
    EXPECT_EQ(stream->tell(), 135'546);
    EXPECT_TRUE(stream.read(100'000) == all.substr(135'546));
    EXPECT_TRUE(stream->eof());
  }
}

TEST(zxfile, a_file_that_grows_is_read_on_behind_its_end) {
  const TestFile file("abc");
  const Stream reader(file.name, OpenMode::read);
  EXPECT_EQ(reader.read(10), "abc");
  EXPECT_TRUE(reader->eof());
  Stream writer(file.name, OpenMode::append);
  EXPECT_TRUE(writer.write("def"));
  EXPECT_TRUE(writer.close());
  EXPECT_EQ(reader.read(3), "def");
  EXPECT_EQ(reader->tell(), 6);
}

// ---- thrift

TEST(zxfile, read_ahead_doubles_while_the_reading_goes_on) {
  const TestFile file(pattern(300'000));
  const Reads reads;
  const Stream stream(file.name, OpenMode::read);
  for (int i = 0; i < 300'000; ++i) stream.read(1);
  EXPECT_EQ(Reads::sizes,
            (Sizes{4096, 8192, 16384, 32768, 65536, 65536, 65536, 65536}));
}

TEST(zxfile, a_scattered_record_costs_one_small_read) {
  const TestFile file(pattern(1'000'000));
  const Stream stream(file.name, OpenMode::read);
  const Reads reads;
  for (const std::int64_t place : {900'000, 100, 500'000, 300'000, 700'000}) {
    EXPECT_TRUE(stream->seek(place, Whence::start));
    EXPECT_EQ(stream.read(1259).size(), 1259U);
  }
  EXPECT_EQ(Reads::sizes, (Sizes{4096, 4096, 4096, 4096, 4096}));
}

TEST(zxfile, what_is_as_large_as_the_buffer_goes_past_it) {
  const TestFile file(pattern(400'000));
  const Reads reads;
  const Stream stream(file.name, OpenMode::read);
  stream.read(65'536);
  stream.read(65'535);
  stream.read(200'000);
  EXPECT_EQ(Reads::sizes[0], 65'536U);
  EXPECT_LE(Reads::sizes.size(), 8U);
  // The last of it, but for what had been read ahead, in one call.
  EXPECT_EQ(std::count_if(Reads::sizes.begin(), Reads::sizes.end(),
                          [](std::size_t size) { return size > 65'536; }),
            1);
}

TEST(zxfile, a_seek_within_the_buffer_costs_no_call) {
  const std::string all = pattern(10'000);
  const TestFile file(all);
  const Stream stream(file.name, OpenMode::read);
  stream.read(1000);
  const Faults calls;
  // The first 4096 bytes are there, and the place behind them too.
  for (const std::int64_t place : {0, 1, 999, 1000, 4095, 4096, 17, 0}) {
    EXPECT_TRUE(stream->seek(place, Whence::start)) << place;
    EXPECT_EQ(stream->tell(), place);
    if (place == 4096) continue;
    EXPECT_EQ(stream.read(1), all.substr(static_cast<std::size_t>(place), 1));
  }
  EXPECT_EQ(calls.count(Call::seek), 0);
  EXPECT_EQ(calls.count(Call::read), 0);
}

TEST(zxfile, a_seek_out_of_the_buffer_costs_one_call) {
  const TestFile file(pattern(10'000));
  const Stream stream(file.name, OpenMode::read);
  stream.read(10);
  const Faults calls;
  EXPECT_TRUE(stream->seek(4097, Whence::start));
  EXPECT_EQ(calls.count(Call::seek), 1);
  stream.read(10);
  EXPECT_TRUE(stream->seek(4096, Whence::start));
  EXPECT_EQ(calls.count(Call::seek), 2);
}

TEST(zxfile, telling_the_position_costs_no_call) {
  const TestFile file(pattern(10'000));
  const Stream stream(file.name, OpenMode::read_write);
  const Faults calls;
  EXPECT_EQ(stream->tell(), 0);
  stream.read(10);
  EXPECT_EQ(stream->tell(), 10);
  EXPECT_EQ(calls.count(Call::seek), 0);
  stream.write("abc");
  const int calls_so_far = calls.count(Call::seek);
  EXPECT_EQ(stream->tell(), 13);
  EXPECT_EQ(calls.count(Call::seek), calls_so_far);
}

TEST(zxfile, small_writes_cost_one_call_for_each_64_kib) {
  const TestFile file("");
  const std::string all = pattern(65'536 * 3 + 10);
  const Faults calls;
  Stream stream(file.name, OpenMode::create);
  for (std::size_t i = 0; i < all.size(); ++i) stream.write(all.substr(i, 1));
  EXPECT_EQ(calls.count(Call::write), 3);
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(calls.count(Call::write), 4);
  EXPECT_TRUE(file.bytes() == all);
}

// ---- writing

TEST(zxfile, pieces_of_every_size_are_written_as_they_are) {
  const TestFile file("");
  for (const std::size_t first : k_edges) {
    for (const std::size_t second : k_edges) {
      SCOPED_TRACE(testing::Message() << first << ", " << second);
      const std::string all = pattern(first + second + 1);
      Stream stream(file.name, OpenMode::create);
      ASSERT_TRUE(stream.write(all.substr(0, first)));
      ASSERT_EQ(stream->tell(), static_cast<std::int64_t>(first));
      ASSERT_TRUE(stream.write(all.substr(first, second)));
      ASSERT_TRUE(stream.write(all.substr(first + second)));
      ASSERT_EQ(stream->tell(), static_cast<std::int64_t>(all.size()));
      ASSERT_TRUE(stream.close());
      ASSERT_TRUE(file.bytes() == all);
    }
  }
}

TEST(zxfile, bytes_wait_in_the_buffer_until_a_flush) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_EQ(file.bytes(), "");
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(file.bytes(), "abc");
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(file.bytes(), "abc");
}

TEST(zxfile, an_unbuffered_stream_writes_at_once) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  stream->set_unbuffered();
  for (const char* bytes : {"a", "bc", "", "def"}) {
    EXPECT_TRUE(stream.write(bytes));
  }
  EXPECT_EQ(file.bytes(), "abcdef");
}

TEST(zxfile, a_sync_flushes_and_asks_the_device) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  const Faults calls;
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_TRUE(stream->sync());
  EXPECT_EQ(file.bytes(), "abc");
  EXPECT_EQ(calls.count(Call::write), 1);
  EXPECT_EQ(calls.count(Call::flush), 1);
}

TEST(zxfile, short_writes_of_the_system_are_gone_on_with) {
  const struct {
    std::size_t most;
    std::size_t size;
  } rows[] = {{1, 5000}, {7, 70'000}, {4096, 200'000}, {65'535, 200'000}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.most);
    const std::string all = pattern(row.size);
    const TestFile file("");
    Faults faults;
    faults.limit_writes(row.most);
    Stream stream(file.name, OpenMode::create);
    EXPECT_TRUE(stream.write(all));
    EXPECT_TRUE(stream->flush());
    EXPECT_EQ(stream->tell(), static_cast<std::int64_t>(row.size));
    EXPECT_TRUE(stream.close());
    EXPECT_TRUE(file.bytes() == all);
  }
}

TEST(zxfile, appending_starts_at_the_end_and_stays_there) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::append);
  EXPECT_EQ(stream->tell(), 3);
  EXPECT_TRUE(stream.write("def"));
  EXPECT_EQ(stream->tell(), 6);
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(stream->tell(), 6);
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(file.bytes(), "abcdef");
}

TEST(zxfile, appending_behind_a_seek_tells_where_the_bytes_went) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::append);
  EXPECT_TRUE(stream->seek(0, Whence::start));
  EXPECT_TRUE(stream.write("de"));
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(stream->tell(), 5);
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(file.bytes(), "abcde");
}

// ---- changing over

TEST(zxfile, unread_bytes_are_given_back_ahead_of_a_write) {
  const TestFile file("abcdefghij");
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(3), "abc");
  EXPECT_TRUE(stream.write("XY"));
  EXPECT_EQ(stream->tell(), 5);
  EXPECT_EQ(stream.read(2), "fg");
  EXPECT_TRUE(stream.write("Z"));
  EXPECT_EQ(stream.read(5), "ij");
  EXPECT_TRUE(stream->eof());
  EXPECT_TRUE(stream.write("!"));
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(file.bytes(), "abcXYfgZij!");
}

TEST(zxfile, written_bytes_are_seen_by_a_read_behind_a_seek) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(10), "abcdefghij");
  EXPECT_TRUE(stream->seek(2, Whence::start));
  EXPECT_TRUE(stream.write("XY"));
  EXPECT_TRUE(stream->seek(0, Whence::start));
  EXPECT_EQ(stream.read(10), "abXYefghij");
}

TEST(zxfile, seeks_count_from_all_three_places) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  stream.read(3);
  EXPECT_TRUE(stream->seek(2, Whence::current));
  EXPECT_EQ(stream->tell(), 5);
  EXPECT_EQ(stream.read(1), "f");
  EXPECT_TRUE(stream->seek(-4, Whence::end));
  EXPECT_EQ(stream->tell(), 6);
  EXPECT_TRUE(stream.write("X"));
  EXPECT_TRUE(stream->seek(-3, Whence::current));
  EXPECT_EQ(stream->tell(), 4);
  EXPECT_EQ(stream.read(10), "efXhij");
  EXPECT_TRUE(stream->seek(0, Whence::end));
  EXPECT_EQ(stream->tell(), 10);
}

TEST(zxfile, a_position_ahead_of_the_file_is_refused) {
  const TestFile file("abc");
  const Stream stream(file.name, OpenMode::read);
  EXPECT_FALSE(stream->seek(-1, Whence::start));
  EXPECT_FALSE(stream->seek(-4, Whence::end));
  EXPECT_TRUE(stream->seek(1, Whence::start));
  EXPECT_FALSE(stream->seek(-2, Whence::current));
  EXPECT_TRUE(stream->seek(1, Whence::start));
  EXPECT_EQ(stream.read(5), "bc");
}

TEST(zxfile, behind_the_end_there_is_nothing_to_read_but_room_to_write) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_TRUE(stream->seek(6, Whence::start));
  EXPECT_EQ(stream.read(1), "");
  EXPECT_TRUE(stream->eof());
  EXPECT_TRUE(stream.write("X"));
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(file.bytes(), std::string("abc\0\0\0X", 7));
}

// ---- random operations

class Random {
 public:
  explicit Random(unsigned seed) : engine(seed) {}

  std::size_t below(std::size_t limit) { return engine() % limit; }

  // Mostly small, sometimes at an edge of the buffer.
  std::size_t size() {
    if (below(4) != 0) return below(300);
    if (below(3) == 0) return below(10'000);
    return k_edges[below(std::size(k_edges))] + below(3);
  }

  std::string text(std::size_t length) {
    std::string bytes(length, '\0');
    const std::size_t start = below(256);
    for (std::size_t i = 0; i < length; ++i)
      bytes[i] = static_cast<char>((start + i * 11 + i / 256) & 0xFF);
    return bytes;
  }

 private:
  std::mt19937 engine;
};

// Carries the same random operations out on a stream and on its model.
class Duel {
 public:
  Duel(const TestFile& file, unsigned seed)
      : random(seed), stream(file.name, OpenMode::read_write) {
    model.bytes = file.bytes();
  }

  void step() {
    switch (random.below(14)) {
      case 0:
      case 1:
        return read();
      case 2:
      case 3:
        return write();
      case 4:
        return seek();
      case 5:
        return seek_nearby();
      case 6:
        return seek_from_end();
      case 7:
        return get();
      case 8:
        return put();
      case 9:
      case 10:
        return view();
      case 11:
        return set_size();
      case 12:
        return rearrange();
      default:
        return look();
    }
  }

  bool close() { return stream.close(); }

  FileModel model;

 private:
  void read() {
    const std::size_t size = random.size();
    ASSERT_TRUE(stream.read(size) == model.read(size)) << size;
    ASSERT_EQ(stream->eof(), model.met_end);
  }

  void write() {
    const std::string text = random.text(random.size());
    ASSERT_TRUE(stream.write(text));
    model.write(text);
  }

  void get() {
    for (std::size_t left = random.below(300); left > 0; --left) {
      const std::string byte = model.read(1);
      const int expected =
          byte.empty() ? -1 : static_cast<unsigned char>(byte[0]);
      ASSERT_EQ(stream->get(), expected);
      ASSERT_EQ(stream->eof(), model.met_end);
    }
  }

  void put() {
    const std::string text = random.text(random.size());
    for (const char byte : text) ASSERT_TRUE(stream->put(byte));
    model.write(text);
  }

  // Takes a part of what is to be seen of the buffer.
  void view() {
    const std::string_view bytes = stream->unread();
    const std::size_t count =
        bytes.empty() ? 1 : 1 + random.below(bytes.size());
    ASSERT_TRUE(bytes.substr(0, count) == model.read(count));
    stream->skip(bytes.empty() ? 0 : count);
    ASSERT_EQ(stream->eof(), model.met_end);
  }

  void set_size() {
    const std::size_t size = random.below(2 * model.bytes.size() + 100);
    model.bytes.resize(std::min(size, std::size_t{200'000}));
    const auto wanted = static_cast<std::int64_t>(model.bytes.size());
    ASSERT_TRUE(stream->set_size(wanted));
    ASSERT_EQ(stream->size(), wanted);
  }

  // What changes nothing that can be seen.
  void rearrange() {
    if (random.below(8) == 0) {
      ASSERT_TRUE(stream->set_buffer(1 + random.below(70'000)));
    } else {
      ASSERT_TRUE(stream->drop_unread());
    }
  }

  // Up to a little behind the end.
  void seek() {
    const std::size_t place = random.below(model.bytes.size() + 100);
    ASSERT_TRUE(stream->seek(static_cast<std::int64_t>(place), Whence::start));
    model.seek(place);
  }

  void seek_nearby() {
    const std::size_t back = std::min(random.size(), model.at);
    const std::size_t ahead = random.below(2) * random.below(500);
    const auto offset =
        static_cast<std::int64_t>(ahead) - static_cast<std::int64_t>(back);
    ASSERT_TRUE(stream->seek(offset, Whence::current));
    model.seek(model.at + ahead - back);
  }

  void seek_from_end() {
    const std::size_t back = random.below(model.bytes.size() + 1);
    ASSERT_TRUE(stream->seek(-static_cast<std::int64_t>(back), Whence::end));
    model.seek(model.bytes.size() - back);
  }

  void look() {
    ASSERT_EQ(stream->tell(), static_cast<std::int64_t>(model.at));
    ASSERT_FALSE(stream->error());
    if (random.below(3) == 0) {
      ASSERT_TRUE(stream->flush());
    }
  }

  Random random;
  Stream stream;
};

void fight(unsigned seed, int steps) {
  SCOPED_TRACE(testing::Message() << "seed " << seed);
  Random random(seed);
  const TestFile file(pattern(random.below(3) * random.below(150'000)));
  Duel duel(file, seed);
  for (int i = 0; i < steps; ++i) {
    SCOPED_TRACE(testing::Message() << "step " << i);
    duel.step();
    if (testing::Test::HasFatalFailure()) return;
  }
  ASSERT_TRUE(duel.close());
  ASSERT_TRUE(file.bytes() == duel.model.bytes);
}

void fight_many(unsigned first, unsigned count, int steps) {
  for (unsigned seed = first; seed < first + count; ++seed) {
    fight(seed, steps);
    if (testing::Test::HasFatalFailure()) return;
  }
}

TEST(zxfile, random_operations_do_what_they_do_to_a_string) {
  fight_many(1, 150, 200);
}

TEST(zxfile, random_operations_with_short_reads_and_writes_come_out_alike) {
  Faults faults;
  faults.limit_writes(1000);
  const Reads few(777);
  fight_many(1001, 30, 200);
}

TEST(zxfile_slow, many_random_operations_do_what_they_do_to_a_string) {
  fight_many(100'001, 4000, 400);
}

// ---- closing all that is open

// While one lives, it notes the descriptors that are closed, in order.
class Closings {
 public:
  Closings() {
    // What tests left open that were jumped out of is not of interest.
    zxStream::close_all();
    closed.clear();
    zxplat::files.close = [](zxplat::Fd fd) {
      closed.push_back(fd);
      return zxplat::system_files.close(fd);
    };
  }
  Closings(const Closings&) = delete;
  Closings& operator=(const Closings&) = delete;
  ~Closings() { zxplat::files.close = zxplat::system_files.close; }

  // The descriptors closed since the last call, from the lowest on.
  static std::vector<zxplat::Fd> take() {
    std::vector<zxplat::Fd> taken;
    taken.swap(closed);
    std::sort(taken.begin(), taken.end());
    return taken;
  }

 private:
  static inline std::vector<zxplat::Fd> closed;
};

using Descriptors = std::vector<zxplat::Fd>;

bool is_open(zxplat::Fd fd) { return zxplat::files.size(fd) >= 0; }

TEST(zxfile, closing_all_writes_down_what_waits_in_the_buffers) {
  const Closings closings;
  const TestFile a("");
  const TestFile b("before ");
  const TestFile c("0123456789");
  Stream created(a.name, OpenMode::create);
  Stream appended(b.name, OpenMode::append);
  Stream changed(c.name, OpenMode::read_write);
  EXPECT_TRUE(created.write("created"));
  EXPECT_TRUE(appended.write("appended"));
  EXPECT_EQ(changed.read(3), "012");
  EXPECT_TRUE(changed.write("XY"));
  zxStream::close_all();
  EXPECT_EQ(a.bytes(), "created");
  EXPECT_EQ(b.bytes(), "before appended");
  EXPECT_EQ(c.bytes(), "012XY56789");
  for (Stream* stream : {&created, &appended, &changed})
    EXPECT_TRUE(stream->close());
  EXPECT_EQ(a.bytes(), "created");
  EXPECT_EQ(b.bytes(), "before appended");
  EXPECT_EQ(c.bytes(), "012XY56789");
}

TEST(zxfile, closing_all_gives_every_descriptor_back_once) {
  const Closings closings;
  const TestFile file("abc");
  Descriptors descriptors;
  std::vector<zxStream*> streams;
  for (int i = 0; i < 20; ++i) {
    streams.push_back(zxStream::open(file.name, OpenMode::read));
    descriptors.push_back(streams.back()->descriptor());
  }
  std::sort(descriptors.begin(), descriptors.end());
  zxStream::close_all();
  EXPECT_EQ(Closings::take(), descriptors);
  for (const zxplat::Fd fd : descriptors) EXPECT_FALSE(is_open(fd)) << fd;
  for (const zxStream* stream : streams)
    EXPECT_EQ(stream->descriptor(), zxplat::k_no_fd);
  zxStream::close_all();
  for (zxStream* stream : streams) EXPECT_TRUE(zxStream::close(stream));
  EXPECT_EQ(Closings::take(), Descriptors{});
}

TEST(zxfile, without_an_open_stream_closing_all_does_nothing) {
  const Closings closings;
  zxStream::close_all();
  EXPECT_EQ(Closings::take(), Descriptors{});
}

// Brings a stream into a state in which it may be when all are closed.
struct UseRow {
  const char* name;
  OpenMode mode;
  void (*use)(const Stream& stream);
};
const UseRow k_uses[] = {
    {"unused", OpenMode::read_write, [](const Stream&) {}},
    {"reading", OpenMode::read, [](const Stream& s) { s.read(3); }},
    {"at its end", OpenMode::read, [](const Stream& s) { s.read(20'000); }},
    {"writing", OpenMode::read_write, [](const Stream& s) { s.write("XYZ"); }},
    {"written", OpenMode::read_write,
     [](const Stream& s) {
       s.write("XYZ");
       s->flush();
     }},
    {"appending", OpenMode::append, [](const Stream& s) { s.write("XYZ"); }},
    {"unbuffered", OpenMode::read_write,
     [](const Stream& s) {
       s->set_unbuffered();
       s.write("XYZ");
     }},
    {"positioned", OpenMode::read_write,
     [](const Stream& s) { s->seek(5000, Whence::start); }},
};

TEST(zxfile, what_is_asked_of_a_stream_behind_closing_all_fails) {
  for (const UseRow& row : k_uses) {
    SCOPED_TRACE(row.name);
    const Closings closings;
    const TestFile file(pattern(10'000));
    Stream stream(file.name, row.mode);
    row.use(stream);
    zxStream::close_all();
    const std::string left = file.bytes();
    // A file that takes the number must not be touched.
    const TestFile other("other");
    Stream taker(other.name, OpenMode::read_write);

    EXPECT_TRUE(stream->flush());  // there is nothing to flush
    EXPECT_EQ(stream->tell(), -1);
    EXPECT_FALSE(stream->seek(0, Whence::start));
    EXPECT_FALSE(stream->seek(1, Whence::start));
    EXPECT_FALSE(stream->seek(-1, Whence::current));
    EXPECT_FALSE(stream->seek(0, Whence::end));
    EXPECT_EQ(stream.read(1), "");
    EXPECT_EQ(stream.read(5000), "");
    EXPECT_EQ(stream.read(100'000), "");
    EXPECT_TRUE(stream->error());
    EXPECT_FALSE(stream->eof());
    EXPECT_EQ(stream->tell(), -1);
    EXPECT_FALSE(stream->sync());
    EXPECT_EQ(stream->descriptor(), zxplat::k_no_fd);

    EXPECT_TRUE(taker.close());
    EXPECT_EQ(other.bytes(), "other");
    EXPECT_TRUE(file.bytes() == left);
  }
}

// Bytes that wait in a buffer are refused when they are to be written down.
TEST(zxfile, what_is_written_behind_closing_all_is_refused) {
  for (const UseRow& row : k_uses) {
    SCOPED_TRACE(row.name);
    const Closings closings;
    const TestFile file(pattern(10'000));
    Stream stream(file.name, row.mode);
    row.use(stream);
    zxStream::close_all();
    const std::string left = file.bytes();
    const TestFile other("other");
    Stream taker(other.name, OpenMode::read_write);

    EXPECT_FALSE(stream.write("lost") && stream->flush());
    EXPECT_TRUE(stream->error());
    EXPECT_FALSE(stream.write(pattern(200'000)));
    EXPECT_FALSE(stream.write("lost") && stream->sync());
    stream->set_unbuffered();
    EXPECT_FALSE(stream.write("lost"));

    EXPECT_TRUE(taker.close());
    EXPECT_EQ(other.bytes(), "other");
    EXPECT_TRUE(file.bytes() == left);
  }
}

TEST(zxfile, a_stream_closes_well_behind_closing_all) {
  for (const UseRow& row : k_uses) {
    for (const bool is_used_again : {false, true}) {
      SCOPED_TRACE(testing::Message() << row.name << is_used_again);
      const Closings closings;
      const TestFile file(pattern(10'000));
      Stream stream(file.name, row.mode);
      row.use(stream);
      zxStream::close_all();
      Closings::take();
      if (is_used_again) {
        stream.read(3);
        stream->seek(0, Whence::start);
      }
      EXPECT_TRUE(stream.close());
      EXPECT_EQ(Closings::take(), Descriptors{});
    }
  }
}

// While one lives, it counts the blocks of memory that are in use.
class Blocks {
 public:
  Blocks() {
    in_use = 0;
    zx_realloc = [](void* block, std::size_t size) {
      if (block == nullptr && size > 0) ++in_use;
      if (block != nullptr && size == 0) --in_use;
      return old(block, size);
    };
  }
  Blocks(const Blocks&) = delete;
  Blocks& operator=(const Blocks&) = delete;
  ~Blocks() { zx_realloc = old; }

  static inline int in_use;

 private:
  static inline void* (*old)(void*, std::size_t) = zx_realloc;
};

TEST(zxfile, a_stream_gives_its_memory_back_with_and_without_closing_all) {
  for (const UseRow& row : k_uses) {
    for (const bool closes_all : {false, true}) {
      SCOPED_TRACE(testing::Message() << row.name << closes_all);
      const Closings closings;
      const TestFile file(pattern(10'000));
      const Blocks blocks;
      Stream stream(file.name, row.mode);
      row.use(stream);
      EXPECT_GE(Blocks::in_use, 1);
      if (closes_all) {
        zxStream::close_all();
        stream.read(3);
      }
      EXPECT_TRUE(stream.close());
      EXPECT_EQ(Blocks::in_use, 0);
    }
  }
}

TEST(zxfile, closing_all_goes_on_over_what_fails) {
  const Closings closings;
  const TestFile a("");
  const TestFile b("");
  Stream first(a.name, OpenMode::create);
  Stream second(b.name, OpenMode::create);
  EXPECT_TRUE(first.write("first"));
  EXPECT_TRUE(second.write("second"));
  {
    Faults faults;
    faults.fail_nth(Call::write, 1, zxplat::k_err_disk_full);
    faults.fail_nth(Call::close, 1);
    zxStream::close_all();
    EXPECT_EQ(faults.count(Call::write), 2);
    EXPECT_EQ(faults.count(Call::close), 2);
  }
  // One of the two was refused.
  EXPECT_EQ(a.bytes().size() + b.bytes().size(), a.bytes().empty() ? 6U : 5U);
  EXPECT_TRUE(first.close());
  EXPECT_TRUE(second.close());
}

TEST(zxfile, streams_can_be_opened_behind_closing_all) {
  const Closings closings;
  const TestFile file("abc");
  Stream old(file.name, OpenMode::read);
  zxStream::close_all();
  Closings::take();
  Stream fresh(file.name, OpenMode::read_write);
  const zxplat::Fd fd = fresh->descriptor();
  EXPECT_EQ(fresh.read(1), "a");
  EXPECT_TRUE(fresh.write("X"));
  zxStream::close_all();
  EXPECT_EQ(Closings::take(), Descriptors{fd});
  EXPECT_EQ(file.bytes(), "aXc");
  EXPECT_TRUE(old.close());
  EXPECT_TRUE(fresh.close());
}

// Opens and closes streams in any order, and now and then all of them.
TEST(zxfile, streams_come_and_go_in_any_order) {
  for (unsigned seed = 1; seed <= 20; ++seed) {
    SCOPED_TRACE(testing::Message() << "seed " << seed);
    const Closings closings;
    const TestFile file("abc");
    Random random(seed);
    std::vector<zxStream*> streams;  // all that were not closed by themselves
    Descriptors open;                // what close_all() must close
    for (int step = 0; step < 300; ++step) {
      const std::size_t choice = random.below(20);
      if (choice == 0) {
        zxStream::close_all();
        std::sort(open.begin(), open.end());
        ASSERT_EQ(Closings::take(), open) << step;
        open.clear();
      } else if (choice < 10 && streams.size() < 30) {
        streams.push_back(zxStream::open(file.name, OpenMode::read));
        ASSERT_NE(streams.back(), nullptr);
        open.push_back(streams.back()->descriptor());
      } else if (!streams.empty()) {
        const auto at = streams.begin() + static_cast<std::ptrdiff_t>(
                                              random.below(streams.size()));
        const zxplat::Fd fd = (*at)->descriptor();
        ASSERT_TRUE(zxStream::close(*at));
        streams.erase(at);
        const auto was_open = std::find(open.begin(), open.end(), fd);
        const bool has_one = was_open != open.end();
        ASSERT_EQ(Closings::take(), has_one ? Descriptors{fd} : Descriptors{});
        if (has_one) open.erase(was_open);
      }
    }
    for (zxStream* stream : streams) EXPECT_TRUE(zxStream::close(stream));
    Closings::take();
    zxStream::close_all();
    EXPECT_EQ(Closings::take(), Descriptors{});
  }
}

TEST(zxfile, closing_all_leaves_the_standard_streams_alone) {
  const Closings closings;
  zxStream::close_all();
  EXPECT_EQ(Closings::take(), Descriptors{});
  for (const zxplat::Fd fd :
       {zxplat::k_stdin_fd, zxplat::k_stdout_fd, zxplat::k_stderr_fd})
    EXPECT_EQ(zx_standard_stream(fd).descriptor(), fd);
}

// What the standard streams hold is neither lost nor written by it.
ZX_CASE(zxfile_closes_all) {
  init_zxlib_args(argc, argv);
  char byte = '?';
  g_stdin.read(&byte, 1);
  oprint("first ");
  zxStream::close_all();
  zxplat::write_all(zxplat::k_stdout_fd, "closed ");
  g_stdin.read(&byte, 1);
  oprint("then #", byte);
  eprint("errors");
  return 0;
}

TEST(zxfile, the_standard_streams_work_on_behind_closing_all) {
  kit::ProcessOptions options;
  options.input = "ab";
  const auto result = kit::run_case("zxfile_closes_all", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "closed first then b");
  EXPECT_EQ(result.err, "errors");
}

TEST(zxfile, a_file_above_a_stream_closes_without_failing) {
  for (const bool is_explicit : {true, false}) {
    const Closings closings;
    const TestFile written("");
    const TestFile read("abc");
    const kit::Failure failure = kit::failure_of([&] {
      zxBFile output;
      zxBFile input;
      output.create(written.name.c_str());
      output.puts("text");
      input.open_or_die(read.name.c_str());
      char byte;
      input.read_all(&byte, 1);
      zxStream::close_all();
      if (!is_explicit) return;  // the destructors close
      output.close(no_detail);
      EXPECT_TRUE(input.close());
    });
    EXPECT_FALSE(failure.failed) << failure.screen;
    EXPECT_EQ(written.bytes(), "text");
  }
}

// ---- bytes and pieces of the buffer

TEST(zxfile, bytes_are_got_one_by_one_as_numbers_from_0_to_255) {
  const TestFile file(std::string("\0\x7F\x80\xFF", 4));
  const Stream stream(file.name, OpenMode::read);
  for (const int byte : {0, 127, 128, 255}) EXPECT_EQ(stream->get(), byte);
  EXPECT_FALSE(stream->eof());
  EXPECT_EQ(stream->get(), -1);
  EXPECT_TRUE(stream->eof());
  EXPECT_FALSE(stream->error());
  EXPECT_EQ(stream->tell(), 4);
}

TEST(zxfile, bytes_cost_no_call_of_the_system_each) {
  const TestFile file("");
  const Faults calls;
  Stream writer(file.name, OpenMode::create);
  for (int i = 0; i < 65'535; ++i) ASSERT_TRUE(writer->put('x'));
  EXPECT_EQ(calls.count(Call::write), 0);
  EXPECT_TRUE(writer->put('y'));
  EXPECT_EQ(calls.count(Call::write), 1);
  EXPECT_TRUE(writer->put('z'));
  EXPECT_TRUE(writer.close());
  EXPECT_EQ(calls.count(Call::write), 2);
  EXPECT_TRUE(file.bytes() == std::string(65'535, 'x') + "yz");

  const Stream reader(file.name, OpenMode::read);
  for (int i = 0; i < 4096; ++i) EXPECT_EQ(reader->get(), 'x');
  EXPECT_EQ(calls.count(Call::read), 1);
}

TEST(zxfile, a_byte_to_an_unbuffered_stream_is_written_at_once) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  EXPECT_TRUE(stream->put('a'));
  EXPECT_EQ(file.bytes(), "");
  stream->set_unbuffered();
  EXPECT_TRUE(stream->put('b'));
  EXPECT_EQ(file.bytes(), "ab");
  EXPECT_TRUE(stream->put('c'));
  EXPECT_EQ(file.bytes(), "abc");
}

TEST(zxfile, a_byte_that_cannot_be_got_or_put_is_told) {
  const TestFile file("abc");
  {
    Stream stream(file.name, OpenMode::read_write);
    Faults faults;
    faults.fail_nth(Call::read, 1);
    EXPECT_EQ(stream->get(), -1);
    EXPECT_TRUE(stream->error());
    EXPECT_FALSE(stream->eof());
    EXPECT_EQ(stream->get(), 'a');
    faults.fail_nth(Call::seek, 1);  // "bc" cannot be given back
    EXPECT_FALSE(stream->put('x'));
    EXPECT_FALSE(stream.close());
  }
  Stream stream(file.name, OpenMode::create);
  stream->set_unbuffered();
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(stream->put('x'));
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, what_is_unread_is_seen_and_passed_over_in_pieces) {
  const TestFile file(pattern(5000));
  const Stream stream(file.name, OpenMode::read);
  EXPECT_TRUE(stream->unread() == pattern(5000).substr(0, 4096));
  EXPECT_TRUE(stream->unread() == pattern(5000).substr(0, 4096));
  stream->skip(4000);
  EXPECT_EQ(stream->tell(), 4000);
  EXPECT_TRUE(stream->unread() == pattern(5000).substr(4000, 96));
  EXPECT_TRUE(stream.read(1) == pattern(5000).substr(4000, 1));
  stream->skip(95);
  EXPECT_TRUE(stream->unread() == pattern(5000).substr(4096));
  EXPECT_FALSE(stream->eof());
  stream->skip(904);
  EXPECT_EQ(stream->unread(), "");
  EXPECT_TRUE(stream->eof());
  EXPECT_FALSE(stream->error());
}

TEST(zxfile, nothing_is_unread_where_reading_fails) {
  const TestFile file("abc");
  const Stream output(file.name, OpenMode::append);
  EXPECT_EQ(output->unread(), "");
  EXPECT_TRUE(output->error());
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_TRUE(stream.write("x"));
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_EQ(stream->unread(), "");
  EXPECT_TRUE(stream->error());
}

TEST(zxfile, what_others_wrote_is_seen_once_the_unread_is_dropped) {
  const TestFile file("abcdef");
  const Stream reader(file.name, OpenMode::read_write);
  EXPECT_EQ(reader.read(2), "ab");
  {
    Stream writer(file.name, OpenMode::read_write);
    EXPECT_TRUE(writer.write("ABCDEF"));
  }
  EXPECT_EQ(reader.read(1), "c");
  EXPECT_TRUE(reader->drop_unread());
  EXPECT_EQ(reader->tell(), 3);
  EXPECT_EQ(reader.read(10), "DEF");
}

TEST(zxfile, dropping_leaves_what_is_to_be_written) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_TRUE(stream->drop_unread());
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(file.bytes(), "abc");
}

TEST(zxfile, what_cannot_be_given_back_is_dropped_all_the_same) {
  const TestFile file("abcdef");
  const Stream stream(file.name, OpenMode::read);
  EXPECT_EQ(stream.read(2), "ab");
  Faults faults;
  faults.fail_nth(Call::seek, 1);
  EXPECT_FALSE(stream->drop_unread());
  EXPECT_TRUE(stream->error());
  EXPECT_TRUE(stream->seek(2, Whence::start));
  EXPECT_EQ(faults.count(Call::seek), 2);
  EXPECT_EQ(stream.read(10), "cdef");
}

// ---- the buffer's size

TEST(zxfile, a_buffer_of_a_size_reads_as_much_from_the_start_on) {
  const TestFile file(pattern(400'000));
  const struct {
    std::size_t size;
    Sizes reads;
  } rows[] = {
      {1, {4096, 8192, 16384}},  // the least that it ever reads
      {16384, {16384, 32768, 65536, 65536}},
      {24576, {24576, 49152, 65536, 65536}},
      {65536, {65536, 65536, 65536}},
      {100'000, {100'000, 100'000, 100'000}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.size);
    const Stream stream(file.name, OpenMode::read);
    EXPECT_TRUE(stream->set_buffer(row.size));
    const Reads reads;
    while (Reads::sizes.size() < row.reads.size()) {
      ASSERT_FALSE(stream->unread().empty());
      stream->skip(stream->unread().size());
      stream->unread();
    }
    EXPECT_EQ(Reads::sizes, row.reads);
    // Behind a seek it starts anew.
    EXPECT_TRUE(stream->seek(399'999, Whence::start));
    Reads::sizes.clear();
    EXPECT_EQ(stream.read(1).size(), 1U);
    EXPECT_EQ(Reads::sizes, Sizes{row.reads[0]});
  }
}

TEST(zxfile, a_new_buffer_keeps_what_is_unread_and_unwritten) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(3), "abc");
  EXPECT_TRUE(stream->set_buffer(200'000));
  EXPECT_EQ(stream.read(2), "de");
  EXPECT_TRUE(stream.write("XY"));
  EXPECT_TRUE(stream->set_buffer(300'000));
  EXPECT_EQ(file.bytes(), "abcdeXYhij");
  EXPECT_EQ(stream.read(10), "hij");
}

TEST(zxfile, a_larger_buffer_waits_longer_before_it_writes) {
  const TestFile file("");
  const Faults calls;
  Stream stream(file.name, OpenMode::create);
  EXPECT_TRUE(stream.write("x"));
  EXPECT_TRUE(stream->set_buffer(200'000));
  EXPECT_EQ(calls.count(Call::write), 1);
  for (int i = 0; i < 199'999; ++i) EXPECT_TRUE(stream->put('y'));
  EXPECT_EQ(calls.count(Call::write), 1);
  EXPECT_TRUE(stream->put('z'));
  EXPECT_EQ(calls.count(Call::write), 2);
  EXPECT_TRUE(stream.close());
  EXPECT_TRUE(file.bytes() == "x" + std::string(199'999, 'y') + "z");
}

TEST(zxfile, a_buffer_ends_the_writing_at_once) {
  const TestFile file("");
  const Stream stream(file.name, OpenMode::create);
  stream->set_unbuffered();
  EXPECT_TRUE(stream.write("a"));
  EXPECT_TRUE(stream->set_buffer(512));
  EXPECT_TRUE(stream.write("b"));
  EXPECT_TRUE(stream->put('c'));
  EXPECT_EQ(file.bytes(), "a");
}

TEST(zxfile, a_buffer_is_refused_for_no_size_no_file_and_lost_bytes) {
  const Closings closings;
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  EXPECT_FALSE(stream->set_buffer(0));
  EXPECT_TRUE(stream.write("abc"));
  {
    Faults faults;
    faults.fail_nth(Call::write, 1);
    EXPECT_FALSE(stream->set_buffer(1000));
  }
  EXPECT_TRUE(stream->set_buffer(1000));
  zxStream::close_all();
  EXPECT_FALSE(stream->set_buffer(1000));
}

TEST(zxfile, a_dropped_buffer_is_forgotten_and_taken_anew) {
  const TestFile file("abcdefghij");
  const Blocks blocks;
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(3), "abc");
  EXPECT_EQ(Blocks::in_use, 2);
  stream->drop_buffer();
  EXPECT_EQ(Blocks::in_use, 1);
  EXPECT_EQ(stream.read(3), "");  // all of it had been read ahead
  EXPECT_TRUE(stream->seek(8, Whence::start));
  EXPECT_TRUE(stream.write("XY"));
  stream->drop_buffer();
  EXPECT_TRUE(stream->put('Z'));
  EXPECT_TRUE(stream.close());
  EXPECT_EQ(file.bytes(), "abcdefghZj");
  EXPECT_EQ(Blocks::in_use, 0);
}

// ---- the file's size

TEST(zxfile, the_size_is_that_of_the_system) {
  const TestFile file("abc");
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream->size(), 3);
  EXPECT_TRUE(stream->seek(3, Whence::start));
  EXPECT_TRUE(stream.write("def"));
  EXPECT_EQ(stream->size(), 3);
  EXPECT_TRUE(stream->flush());
  EXPECT_EQ(stream->size(), 6);
  EXPECT_EQ(stream->tell(), 6);
  Faults faults;
  faults.fail_nth(Call::size, 1);
  EXPECT_EQ(stream->size(), -1);
}

TEST(zxfile, setting_the_size_flushes_and_keeps_the_position) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(2), "ab");
  EXPECT_TRUE(stream->set_size(5));
  EXPECT_EQ(stream->tell(), 2);
  EXPECT_EQ(stream.read(10), "cde");
  EXPECT_TRUE(stream.write("XYZ"));
  EXPECT_TRUE(stream->set_size(7));
  EXPECT_EQ(file.bytes(), "abcdeXY");
  EXPECT_EQ(stream->tell(), 8);
  EXPECT_TRUE(stream.write("!"));
  EXPECT_TRUE(stream->set_size(11));
  EXPECT_EQ(file.bytes(), std::string("abcdeXY\0!\0\0", 11));
  EXPECT_TRUE(stream->seek(0, Whence::start));
  EXPECT_EQ(stream.read(20), std::string("abcdeXY\0!\0\0", 11));
}

TEST(zxfile, a_size_that_cannot_be_set_is_told) {
  const TestFile file("abcdef");
  const Stream reader(file.name, OpenMode::read);
  EXPECT_FALSE(reader->set_size(2));
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_FALSE(stream->set_size(-1));
  for (const Call call : {Call::set_size, Call::write, Call::seek}) {
    SCOPED_TRACE(kit::name_of(call));
    EXPECT_TRUE(stream->seek(0, Whence::start));
    EXPECT_EQ(stream.read(1), "a");
    if (call == Call::write) {
      EXPECT_TRUE(stream.write("b"));
    }
    Faults faults;
    faults.fail_nth(call, 1);
    EXPECT_FALSE(stream->set_size(2));
  }
  EXPECT_EQ(file.bytes(), "abcdef");
}

// ---- locks

void expect_refused(const Stream& stream, std::int64_t start,
                    std::int64_t size) {
  zxplat::set_last_error(0);
  EXPECT_FALSE(stream->lock(start, size)) << start << ", " << size;
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_lock);
}

TEST(zxfile, a_stream_is_kept_out_by_its_own_locks_and_by_those_of_others) {
  const TestFile file("abcdefghij");
  const Stream first(file.name, OpenMode::read_write);
  const Stream second(file.name, OpenMode::read_write);
  EXPECT_TRUE(first->lock(2, 3));
  EXPECT_TRUE(first->lock(7, 1));
  for (const Stream* stream : {&first, &second}) {
    for (const auto& [start, size] :
         std::vector<std::pair<int, int>>{{2, 3}, {0, 3}, {4, 1}, {0, 100}})
      expect_refused(*stream, start, size);
    expect_refused(*stream, 7, 1);
  }
  EXPECT_TRUE(first->lock(5, 2));   // between the two
  EXPECT_TRUE(second->lock(0, 2));  // just ahead
  EXPECT_TRUE(second->lock(8, 2));  // just behind
}

TEST(zxfile, a_stream_asks_the_system_of_its_own_locks_nothing) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  EXPECT_TRUE(stream->lock(2, 3));
  const Faults calls;
  expect_refused(stream, 3, 1);
  EXPECT_FALSE(stream->unlock(2, 2));
  EXPECT_EQ(calls.count(Call::lock) + calls.count(Call::unlock), 0);
}

TEST(zxfile, exactly_what_was_locked_is_unlocked_in_any_order) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  const Stream other(file.name, OpenMode::read_write);
  for (const int start : {0, 2, 4}) EXPECT_TRUE(stream->lock(start, 2));
  for (const auto& [start, size] :
       std::vector<std::pair<int, int>>{{0, 1}, {1, 1}, {0, 4}, {6, 2}}) {
    zxplat::set_last_error(0);
    EXPECT_FALSE(stream->unlock(start, size));
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_not_locked);
  }
  for (const int start : {2, 4, 0}) {
    expect_refused(other, start, 1);
    EXPECT_TRUE(stream->unlock(start, 2));
    EXPECT_TRUE(other->lock(start, 1));
    EXPECT_FALSE(stream->unlock(start, 2));
  }
}

TEST(zxfile, a_lock_that_the_system_refuses_is_not_held) {
  const TestFile file("abcdefghij");
  const Stream stream(file.name, OpenMode::read_write);
  Faults faults;
  faults.fail_nth(Call::lock, 1, zxplat::k_err_io);
  EXPECT_FALSE(stream->lock(0, 1));
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_io);
  EXPECT_FALSE(stream->unlock(0, 1));
  EXPECT_TRUE(stream->lock(0, 1));
  faults.fail_nth(Call::unlock, 1, zxplat::k_err_io);
  EXPECT_FALSE(stream->unlock(0, 1));
  expect_refused(stream, 0, 1);  // it is held on
  EXPECT_TRUE(stream->unlock(0, 1));
}

TEST(zxfile, locks_end_with_the_stream_and_with_closing_all) {
  const Closings closings;
  const TestFile file("abcdefghij");
  const Blocks blocks;
  {
    Stream first(file.name, OpenMode::read_write);
    Stream second(file.name, OpenMode::read_write);
    EXPECT_TRUE(first->lock(0, 1));
    EXPECT_TRUE(first->lock(1, 1));
    EXPECT_TRUE(first.close());
    EXPECT_TRUE(second->lock(0, 2));
    zxStream::close_all();
    Stream third(file.name, OpenMode::read_write);
    EXPECT_TRUE(third->lock(0, 2));
    EXPECT_FALSE(second->unlock(0, 2));
    EXPECT_EQ(zxplat::last_error(), zxplat::k_err_not_locked);
    EXPECT_FALSE(second->lock(5, 1));
  }
  EXPECT_EQ(Blocks::in_use, 0);
}

// ---- failing calls

TEST(zxfile, a_failing_open_gives_null) {
  const TestFile file("abc");
  Faults faults;
  faults.fail_nth(Call::open, 1, zxplat::k_err_too_many_open);
  EXPECT_EQ(zxStream::open(file.name, OpenMode::read), nullptr);
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_too_many_open);
}

TEST(zxfile, a_failing_read_is_an_error_and_no_end) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::read);
  Faults faults;
  faults.fail_nth(Call::read, 1);
  EXPECT_EQ(stream.read(3), "");
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream->eof());
  // The call may work again; what went wrong stays known.
  EXPECT_EQ(stream.read(3), "abc");
  EXPECT_TRUE(stream->error());
}

TEST(zxfile, a_read_that_fails_later_gives_what_came_before) {
  const std::string all = pattern(100'000);
  const TestFile file(all);
  const Stream stream(file.name, OpenMode::read);
  Faults faults;
  faults.fail_nth(Call::read, 2);
  EXPECT_TRUE(stream.read(50'000) == all.substr(0, 4096));
  EXPECT_TRUE(stream->error());
}

TEST(zxfile, closing_does_not_complain_of_an_earlier_failed_read) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::read_write);
  {
    Faults faults;
    faults.fail_nth(Call::read, 1);
    stream.read(3);
  }
  EXPECT_TRUE(stream->error());
  EXPECT_TRUE(stream.close());
}

TEST(zxfile, reading_what_is_open_for_writing_fails) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::create);
  EXPECT_EQ(stream.read(3), "");
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream->eof());
}

TEST(zxfile, writing_what_is_open_for_reading_loses_the_bytes_and_says_so) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::read);
  stream.write("X");
  EXPECT_FALSE(stream->flush());
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream.close());
  EXPECT_EQ(file.bytes(), "abc");
}

TEST(zxfile, a_refused_byte_is_told_at_the_flush_and_at_the_close) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  Faults faults;
  faults.fail_nth(Call::write, 1, zxplat::k_err_disk_full);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_FALSE(stream->error());
  EXPECT_FALSE(stream->flush());
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_disk_full);
  EXPECT_TRUE(stream->error());
  EXPECT_TRUE(stream->flush());  // there is nothing left to flush
  EXPECT_TRUE(stream.write("def"));
  EXPECT_FALSE(stream.close());
  EXPECT_EQ(file.bytes(), "def");  // what was lost is not written twice
}

TEST(zxfile, a_write_that_fills_the_buffer_tells_at_once) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(stream.write(pattern(65'536)));
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, an_unbuffered_write_tells_at_once) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  stream->set_unbuffered();
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(stream.write("a"));
  EXPECT_TRUE(stream.write("b"));
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, a_write_refused_at_the_close_makes_it_fail) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  EXPECT_TRUE(stream.write("abc"));
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(stream.close());
  EXPECT_EQ(faults.count(Call::close), 1);  // the descriptor is given back
}

TEST(zxfile, a_system_that_takes_no_byte_is_no_endless_loop) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  Faults faults;
  faults.limit_writes(0);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_FALSE(stream->flush());
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, a_failing_close_is_a_failure_and_made_once) {
  const TestFile file("abc");
  Stream stream(file.name, OpenMode::read);
  Faults faults;
  faults.fail_all(Call::close);
  EXPECT_FALSE(stream.close());
  EXPECT_EQ(faults.count(Call::close), 1);
}

TEST(zxfile, a_failing_sync_is_told_again_by_the_close) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  Faults faults;
  faults.fail_nth(Call::flush, 1);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_FALSE(stream->sync());
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, a_sync_whose_write_fails_does_not_ask_the_device) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::create);
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_FALSE(stream->sync());
  EXPECT_EQ(faults.count(Call::flush), 0);
}

TEST(zxfile, a_failing_seek_is_told_and_the_next_one_works) {
  const TestFile file(pattern(10'000));
  const Stream stream(file.name, OpenMode::read);
  stream.read(10);
  Faults faults;
  faults.fail_nth(Call::seek, 1);
  EXPECT_FALSE(stream->seek(9000, Whence::start));
  EXPECT_TRUE(stream->seek(9000, Whence::start));
  EXPECT_EQ(stream->tell(), 9000);
  EXPECT_EQ(stream.read(100), pattern(10'000).substr(9000, 100));
}

TEST(zxfile, a_seek_whose_flush_fails_is_told_and_so_is_the_close) {
  const TestFile file("");
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_TRUE(stream.write("abc"));
  Faults faults;
  faults.fail_nth(Call::write, 1);
  EXPECT_FALSE(stream->seek(0, Whence::start));
  EXPECT_TRUE(stream->error());
  EXPECT_FALSE(stream.close());
}

TEST(zxfile, an_unknown_position_that_the_system_does_not_tell_is_minus_one) {
  const TestFile file("abc");
  const Stream stream(file.name, OpenMode::append);
  Faults faults;
  faults.fail_nth(Call::seek, 1);
  EXPECT_EQ(stream->tell(), -1);
  EXPECT_EQ(stream->tell(), 3);
}

TEST(zxfile, a_write_that_cannot_give_unread_bytes_back_is_refused) {
  const TestFile file("abcdefghij");
  Stream stream(file.name, OpenMode::read_write);
  EXPECT_EQ(stream.read(3), "abc");
  Faults faults;
  faults.fail_nth(Call::seek, 1);
  EXPECT_FALSE(stream.write("X"));
  EXPECT_TRUE(stream->error());
  EXPECT_EQ(file.bytes(), "abcdefghij");
  EXPECT_FALSE(stream.close());  // the byte did not reach the file
}

// A full device refuses at the latest when the stream is closed.
TEST(zxfile, a_full_device_makes_the_close_fail) {
  const std::string device = kit::full_device();
  if (device.empty()) GTEST_SKIP() << "the system has no full device";
  Stream stream(device, OpenMode::create);
  EXPECT_TRUE(stream.write("abc"));
  EXPECT_FALSE(stream.close());
  EXPECT_EQ(zxplat::last_error(), zxplat::k_err_disk_full);
}

// Each write in turn fails in a long random run: the close tells whenever
// bytes were lost, and does not when all went well.
TEST(zxfile, a_lost_write_never_goes_untold) {
  constexpr unsigned k_seed = 77;
  int total = 0;
  for (int n = 1; n <= total + 1; ++n) {
    const TestFile file(pattern(100'000));
    Random random(k_seed);
    Stream stream(file.name, OpenMode::read_write);
    Faults faults;
    faults.fail_nth(Call::write, n);
    for (int i = 0; i < 60; ++i) {
      if (random.below(2) == 0) stream.write(random.text(random.size()));
      if (random.below(3) == 0) stream.read(random.size());
      if (random.below(4) == 0) {
        stream->seek(static_cast<std::int64_t>(random.below(200'000)),
                     Whence::start);
      }
    }
    const bool closed = stream.close();
    if (n == 1) total = faults.count(Call::write);
    EXPECT_EQ(closed, faults.count(Call::write) < n) << n;
    ASSERT_LT(total, 500);
  }
  EXPECT_GT(total, 10);
}

}  // namespace
