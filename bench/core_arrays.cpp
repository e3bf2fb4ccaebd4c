// core_arrays.cpp - zxQVA beside std::vector, and as a queue beside
// std::deque.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <numeric>
#include <random>
#include <vector>

#include "zxqva.h"

namespace {

using benchmark::DoNotOptimize;
using std::int32_t;
using std::int64_t;

using Array = zxQVA<int32_t>;
using Vector = std::vector<int32_t>;
using Deque = std::deque<int32_t>;

// ---- the same names for both sides

void append(Array& array, int32_t value) { array.append(value); }
void append(Vector& vector, int32_t value) { vector.push_back(value); }
void append(Deque& deque, int32_t value) { deque.push_back(value); }

int32_t checked(const Array& array, int32_t i) { return array.get(i); }
int32_t checked(const Vector& vector, int32_t i) {
  return vector.at(static_cast<std::size_t>(i));
}

int32_t take_first(Array& array) { return array.pop_first(); }
int32_t take_first(Deque& deque) {
  const int32_t value = deque.front();
  deque.pop_front();
  return value;
}

// ---- benchmarks

int32_t size_of(const benchmark::State& state) {
  return static_cast<int32_t>(state.range(0));
}

// 0 to n - 1, appended.
template <class Sequence>
void fill(Sequence& sequence, int32_t n) {
  for (int32_t i = 0; i < n; ++i) append(sequence, i);
}

template <class Sequence>
void append_all(benchmark::State& state) {
  const int32_t n = size_of(state);
  for (auto _ : state) {
    Sequence sequence;
    DoNotOptimize(sequence);
    fill(sequence, n);
    DoNotOptimize(sequence);
  }
  state.counters["operations"] = n;
}
BENCHMARK(append_all<Array>)->Name("append/ours")->Arg(10'000)->Arg(1'000'000);
BENCHMARK(append_all<Vector>)->Name("append/peer")->Arg(10'000)->Arg(1'000'000);

template <class Sequence>
void get(benchmark::State& state) {
  const int32_t n = size_of(state);
  Sequence sequence;
  fill(sequence, n);
  std::vector<int32_t> order(static_cast<std::size_t>(n));
  std::iota(order.begin(), order.end(), 0);
  std::shuffle(order.begin(), order.end(), std::mt19937(4711));
  int64_t sum = 0;
  for (auto _ : state) {
    DoNotOptimize(sequence);
    DoNotOptimize(order);
    sum = 0;
    for (const int32_t i : order) sum += checked(sequence, i);
    DoNotOptimize(sum);
  }
  if (sum != int64_t{n} * (n - 1) / 2) state.SkipWithError("wrong elements");
  state.counters["operations"] = n;
}
BENCHMARK(get<Array>)->Name("get/ours")->Arg(10'000);
BENCHMARK(get<Vector>)->Name("get/peer")->Arg(10'000);

// The length is the same ahead of each operation, which is one append and
// one taking from the front.
template <class Queue>
void queue(benchmark::State& state) {
  constexpr int32_t k_operations = 1000;
  const int32_t n = size_of(state);
  Queue waiting;
  fill(waiting, n);
  int64_t sum = 0;
  for (auto _ : state) {
    DoNotOptimize(waiting);
    for (int32_t i = 0; i < k_operations; ++i) {
      append(waiting, i);
      sum += take_first(waiting);
    }
    DoNotOptimize(sum);
  }
  state.counters["operations"] = k_operations;
}
BENCHMARK(queue<Array>)->Name("queue/ours")->Arg(20);
BENCHMARK(queue<Deque>)->Name("queue/peer")->Arg(20);

}  // namespace
