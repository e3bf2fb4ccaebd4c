// patterns_sides.h - registering the sides of bench_patterns, each in a
// source of its own.
#ifndef BENCH_PATTERNS_SIDES_H
#define BENCH_PATTERNS_SIDES_H

namespace patterns {

void add_ours();   // "ours", and "string": the same through strings
void add_pcre2();  // "pcre2" and "jit"
void add_re2();    // "re2"
void add_std();    // "std"
void add_boost();  // "boost"

}  // namespace patterns

#endif  // BENCH_PATTERNS_SIDES_H
