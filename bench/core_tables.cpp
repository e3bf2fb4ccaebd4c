// core_tables.cpp - zxSA beside absl::flat_hash_map, and the checksum that
// hashes its keys beside a table of bytes.
//
// Without BENCH_WITH_ABSL the tables have no peer.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <string_view>
#include <unordered_set>
#include <utility>
#include <vector>

#include "zxaa.h"
#include "zxstr.h"

#ifdef BENCH_WITH_ABSL
#include <absl/container/flat_hash_map.h>
#include <absl/strings/string_view.h>
#endif

namespace {

using benchmark::DoNotOptimize;
using std::int32_t;
using std::int64_t;

// ---- keys

constexpr std::uint32_t k_seed = 4711;

using Texts = std::vector<std::string>;

// A name of 8 to 20 bytes such as "account_4711x".
std::string any_name(std::mt19937& random) {
  static constexpr std::array<std::string_view, 12> k_stems = {
      "bank",     "unit",      "order",      "branch",
      "account",  "payment",   "invoice",    "customer",
      "currency", "portfolio", "instrument", "transaction"};
  std::string name(k_stems[random() % k_stems.size()]);
  name += '_';
  const auto digits = 3 + random() % 5;
  for (unsigned i = 0; i < digits; ++i)
    name += static_cast<char>('0' + random() % 10);
  if (random() % 2 == 0) name += static_cast<char>('a' + random() % 26);
  return name;
}

// Different names, the same in each run.
Texts names(std::size_t n) {
  std::mt19937 random(k_seed);
  std::unordered_set<std::string> seen;
  Texts result;
  while (result.size() < n) {
    std::string name = any_name(random);
    if (seen.insert(name).second) result.push_back(std::move(name));
  }
  return result;
}

Texts shuffled(Texts texts) {
  std::shuffle(texts.begin(), texts.end(), std::mt19937(k_seed + 1));
  return texts;
}

// ---- the same names for both sides

struct Ours {
  using Key = zxStr;
  using Table = zxSA<int32_t>;

  static const int32_t* find(const Table& table, const Key& key) {
    return table.find(key);
  }
  static const int32_t* find(const Table& table, const char* key) {
    return table.find(key);
  }
  static void set(Table& table, const Key& key, int32_t value) {
    table.set(key, value);
  }
};

#ifdef BENCH_WITH_ABSL
struct Peer {
  using Key = std::string;
  using Table = absl::flat_hash_map<std::string, int32_t>;

  template <class AnyKey>
  static const int32_t* find(const Table& table, const AnyKey& key) {
    const auto entry = table.find(key);
    return entry == table.end() ? nullptr : &entry->second;
  }
  static const int32_t* find(const Table& table, const char* key) {
    return find(table, absl::string_view(key));
  }
  static void set(Table& table, const Key& key, int32_t value) {
    table.insert_or_assign(key, value);
  }
};
#endif

// ---- what is made once for each side and size

template <class Key>
std::vector<Key> keys_of(const Texts& texts) {
  std::vector<Key> keys;
  keys.reserve(texts.size());
  for (const std::string& text : texts) keys.emplace_back(text.c_str());
  return keys;
}

// The keys of a table, and of look-ups in the order in which they come. Each
// has characters of its own.
template <class Side>
struct Keys {
  explicit Keys(std::size_t n) {
    Texts first = names(2 * n);
    const Texts second(first.begin() + static_cast<std::ptrdiff_t>(n),
                       first.end());
    first.resize(n);
    stored = keys_of<typename Side::Key>(first);
    wanted_texts = shuffled(first);
    wanted = keys_of<typename Side::Key>(wanted_texts);
    absent = keys_of<typename Side::Key>(second);
  }

  std::vector<typename Side::Key> stored;  // key i has the value i + 1
  std::vector<typename Side::Key> wanted;  // the same in another order
  std::vector<typename Side::Key> absent;
  Texts wanted_texts;
};

template <class Side>
void fill(typename Side::Table& table,
          const std::vector<typename Side::Key>& keys) {
  int32_t value = 0;
  for (const auto& key : keys) Side::set(table, key, ++value);
}

template <class Side>
struct Filled {
  explicit Filled(const Keys<Side>& keys) { fill<Side>(table, keys.stored); }
  typename Side::Table table;
};

std::size_t size_of(const benchmark::State& state) {
  return static_cast<std::size_t>(state.range(0));
}

template <class Side>
Keys<Side>& keys_for(const benchmark::State& state) {
  static std::map<std::size_t, std::unique_ptr<Keys<Side>>> kept;
  auto& keys = kept[size_of(state)];
  if (!keys) keys = std::make_unique<Keys<Side>>(size_of(state));
  return *keys;
}

template <class Side>
typename Side::Table& table_for(const benchmark::State& state) {
  static std::map<std::size_t, std::unique_ptr<Filled<Side>>> kept;
  auto& filled = kept[size_of(state)];
  if (!filled) filled = std::make_unique<Filled<Side>>(keys_for<Side>(state));
  return filled->table;
}

// ---- look-ups

// Looks all keys up; their values must sum up to `expected`.
template <class Side, class AnyKey>
void look_up(benchmark::State& state, std::vector<AnyKey>& keys,
             int64_t expected) {
  typename Side::Table& table = table_for<Side>(state);
  int64_t sum = 0;
  for (auto _ : state) {
    DoNotOptimize(table);
    DoNotOptimize(keys);
    sum = 0;
    for (const AnyKey& key : keys)
      if (const int32_t* value = Side::find(table, key)) sum += *value;
    DoNotOptimize(sum);
  }
  if (sum != expected) state.SkipWithError("wrong values");
  state.counters["operations"] = static_cast<double>(keys.size());
}

int64_t sum_of_values(const benchmark::State& state) {
  return state.range(0) * (state.range(0) + 1) / 2;
}

template <class Side>
void hit(benchmark::State& state) {
  look_up<Side>(state, keys_for<Side>(state).wanted, sum_of_values(state));
}

template <class Side>
void miss(benchmark::State& state) {
  look_up<Side>(state, keys_for<Side>(state).absent, 0);
}

template <class Side>
void hit_by_text(benchmark::State& state) {
  std::vector<const char*> keys;
  for (const std::string& text : keys_for<Side>(state).wanted_texts)
    keys.push_back(text.c_str());
  look_up<Side>(state, keys, sum_of_values(state));
}

// ---- building

template <class Side>
void build(benchmark::State& state) {
  std::vector<typename Side::Key>& keys = keys_for<Side>(state).stored;
  for (auto _ : state) {
    DoNotOptimize(keys);
    typename Side::Table table;
    fill<Side>(table, keys);
    DoNotOptimize(table);
  }
  state.counters["operations"] = static_cast<double>(keys.size());
}

// ---- registration

constexpr int64_t k_largest = 300'000;

void all_sizes(benchmark::internal::Benchmark* benchmark) {
  for (const int64_t n : {100, 1000, 10'000, 60'000}) benchmark->Arg(n);
}

template <class Side>
void register_side(const std::string& side) {
  const auto add = [&side](const char* what, auto* function) {
    return benchmark::RegisterBenchmark((what + ("/" + side)).c_str(),
                                        function);
  };
  add("hit", hit<Side>)->Apply(all_sizes)->Arg(k_largest);
  add("miss", miss<Side>)->Apply(all_sizes)->Arg(k_largest);
  add("build", build<Side>)->Apply(all_sizes);
  add("build", build<Side>)->Arg(k_largest)->Iterations(1);
  add("hit_by_text", hit_by_text<Side>)->Arg(1000);
}

// ---- the checksum

constexpr std::array<std::uint16_t, 256> make_byte_table() {
  std::array<std::uint16_t, 256> table{};
  for (unsigned byte = 0; byte < 256; ++byte) {
    unsigned crc = byte << 8;
    for (int bit = 0; bit < 8; ++bit)
      crc = (crc << 1) ^ ((crc & 0x8000) != 0 ? 0x1021 : 0);
    table[byte] = static_cast<std::uint16_t>(crc);
  }
  return table;
}
constexpr std::array<std::uint16_t, 256> k_byte_table = make_byte_table();

// As crc16(), a byte at a time.
[[gnu::noinline]] std::uint16_t crc16_by_byte(const void* bytes,
                                              std::size_t size) {
  const auto* byte = static_cast<const unsigned char*>(bytes);
  unsigned crc = 0xFFFF;
  for (std::size_t i = 0; i < size; ++i)
    crc = ((crc << 8) & 0xFFFF) ^ k_byte_table[(crc >> 8) ^ byte[i]];
  return static_cast<std::uint16_t>(crc);
}

template <std::uint16_t (*Checksum)(const void*, std::size_t)>
void checksum(benchmark::State& state) {
  Texts texts = names(size_of(state));
  std::vector<std::string_view> keys(texts.begin(), texts.end());
  for (const std::string_view key : keys)
    if (crc16(key.data(), key.size()) != crc16_by_byte(key.data(), key.size()))
      return state.SkipWithError("the checksums differ");
  for (auto _ : state) {
    DoNotOptimize(keys);
    unsigned sum = 0;
    for (const std::string_view key : keys)
      sum += Checksum(key.data(), key.size());
    DoNotOptimize(sum);
  }
  state.counters["operations"] = static_cast<double>(keys.size());
}
BENCHMARK(checksum<crc16>)->Name("checksum/ours")->Arg(1000);
BENCHMARK(checksum<crc16_by_byte>)->Name("checksum/peer")->Arg(1000);

[[maybe_unused]] const bool registered = [] {
  register_side<Ours>("ours");
#ifdef BENCH_WITH_ABSL
  register_side<Peer>("peer");
#endif
  return true;
}();

}  // namespace
