// core_strings.cpp - zxStr beside std::string.
#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <string>

#include "zxstr.h"

namespace {

using benchmark::DoNotOptimize;

// The letters of the alphabet in turn, as many as the benchmark asks for.
std::string text_for(const benchmark::State& state) {
  std::string text;
  for (std::int64_t i = 0; i < state.range(0); ++i)
    text += static_cast<char>('a' + i % 26);
  return text;
}

template <class String>
void copy(benchmark::State& state) {
  String source(text_for(state).c_str());
  for (auto _ : state) {
    DoNotOptimize(source);
    String copied(source);
    DoNotOptimize(copied);
  }
}
BENCHMARK(copy<zxStr>)->Name("copy/ours")->Arg(30)->Arg(200);
BENCHMARK(copy<std::string>)->Name("copy/peer")->Arg(30)->Arg(200);

template <class String>
[[gnu::noipa]] std::size_t length_of(String text) {
  return static_cast<std::size_t>(text.length());
}

template <class String>
void pass(benchmark::State& state) {
  String source(text_for(state).c_str());
  for (auto _ : state) {
    DoNotOptimize(source);
    DoNotOptimize(length_of<String>(source));
  }
}
BENCHMARK(pass<zxStr>)->Name("pass/ours")->Arg(30)->Arg(200);
BENCHMARK(pass<std::string>)->Name("pass/peer")->Arg(30)->Arg(200);

template <class String>
void make(benchmark::State& state) {
  const std::string kept = text_for(state);
  const char* text = kept.c_str();
  for (auto _ : state) {
    DoNotOptimize(text);
    String made(text);
    DoNotOptimize(made);
  }
}
BENCHMARK(make<zxStr>)->Name("make/ours")->Arg(30);
BENCHMARK(make<std::string>)->Name("make/peer")->Arg(30);

template <class String>
void concatenate(benchmark::State& state) {
  String a(text_for(state).c_str());
  String b(text_for(state).c_str());
  String c(text_for(state).c_str());
  for (auto _ : state) {
    DoNotOptimize(a);
    DoNotOptimize(b);
    DoNotOptimize(c);
    String sum = a + b + c;
    DoNotOptimize(sum);
  }
}
BENCHMARK(concatenate<zxStr>)->Name("concatenate/ours")->Arg(30);
BENCHMARK(concatenate<std::string>)->Name("concatenate/peer")->Arg(30);

template <class String>
void append_bytes(benchmark::State& state) {
  std::string source = text_for(state);
  for (auto _ : state) {
    DoNotOptimize(source);
    String text;
    for (const char byte : source) text += byte;
    DoNotOptimize(text);
  }
  state.counters["operations"] = static_cast<double>(source.size());
}
BENCHMARK(append_bytes<zxStr>)->Name("append_bytes/ours")->Arg(1000);
BENCHMARK(append_bytes<std::string>)->Name("append_bytes/peer")->Arg(1000);

}  // namespace
