// zxregexe_memory_impl.h - what a run of the matcher remembers of failures.
// Not installed.
//
// What failed at a place fails whenever a run comes there again, and leaves
// the same counts, because each count that it adds to it has set before.  So a
// run that goes back very often notes down, for each choice, place and current
// group, that it has failed, and with which effect.
#ifndef ZXREGEXE_MEMORY_IMPL_H
#define ZXREGEXE_MEMORY_IMPL_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "zxregexe_impl.h"

namespace zxregexe {

// The counts that a failed try wrote.
struct Effect {
  std::uint32_t touched;                  // a bit for each slot
  std::uint32_t next;                     // with the same hash; 0: none
  std::int32_t counts[zxMatch::k_slots];  // 0 where not touched

  bool operator==(const Effect& other) const {
    return touched == other.touched &&
           std::equal(counts, counts + zxMatch::k_slots, other.counts);
  }
  std::uint32_t hash() const {
    std::uint32_t value = touched;
    for (const std::int32_t count : counts)
      value = (value ^ static_cast<std::uint32_t>(count)) * 16777619U;
    return value ^ (value >> 15);
  }
};

// The different effects, each once, numbered from 1.
class EffectList {
 public:
  static constexpr std::size_t k_most_bytes = 64U << 20;

  void clear() {
    if (effects == nullptr) return;
    zx_realloc(effects, 0);
    effects = nullptr;
    length = capacity = 0;
    std::memset(heads, 0, sizeof heads);
  }

  const Effect& get(std::uint32_t number) const { return effects[number - 1]; }

  // The number of an effect; 0 if there is no room for it.
  std::uint32_t number_of(Effect effect) {
    std::uint32_t& head = heads[effect.hash() % k_heads];
    for (std::uint32_t n = head; n != 0; n = get(n).next)
      if (get(n) == effect) return n;
    if (length == capacity && !grow()) return 0;
    effect.next = head;
    effects[length] = effect;
    return head = ++length;
  }

 private:
  static constexpr std::uint32_t k_heads = 1024;

  bool grow() {
    const std::uint32_t wanted = capacity == 0 ? 64 : 2 * capacity;
    if (wanted > k_most_bytes / sizeof(Effect)) return false;
    void* block = zx_realloc(effects, wanted * sizeof(Effect));
    if (block == nullptr) return false;
    effects = static_cast<Effect*>(block);
    capacity = wanted;
    return true;
  }

  Effect* effects = nullptr;
  std::uint32_t length = 0;
  std::uint32_t capacity = 0;
  std::uint32_t heads[k_heads] = {};
};

class Memory {
 public:
  static constexpr std::size_t k_most_bytes = 64U << 20;

  // Makes room for all steps and groups at all places of the subject; false
  // if that is too much.
  bool open(const zxRegexPlan& plan, const char* subject, const char* end) {
    start = subject;
    places = static_cast<std::size_t>(end - subject) + 1;
    groups = plan.groups + 1U;
    const std::size_t rows = plan.step_count * groups;
    if (rows > k_most_bytes / sizeof cells[0] / places) return false;
    const std::size_t bytes = rows * places * sizeof cells[0];
    cells = static_cast<std::uint32_t*>(zx_realloc(nullptr, bytes));
    if (cells == nullptr) return false;
    std::memset(cells, 0, bytes);
    effects.clear();
    return true;
  }

  void close() {
    zx_realloc(cells, 0);
    cells = nullptr;
    effects.clear();
  }

  bool is_open() const { return cells != nullptr; }

  // The effect of the failure there; null if none is known.
  const Effect* recall(std::size_t step, std::size_t current,
                       const char* at) const {
    const std::uint32_t number = cells[cell(step, current, at)];
    return number == 0 ? nullptr : &effects.get(number);
  }

  void note(std::size_t step, std::size_t current, const char* at,
            const Effect& effect) {
    cells[cell(step, current, at)] = effects.number_of(effect);
  }

 private:
  std::size_t cell(std::size_t step, std::size_t current,
                   const char* at) const {
    return (step * groups + current) * places +
           static_cast<std::size_t>(at - start);
  }

  std::uint32_t* cells = nullptr;
  const char* start = nullptr;
  std::size_t places = 0;
  std::size_t groups = 0;
  EffectList effects;
};
inline constinit Memory memory;

}  // namespace zxregexe

#endif  // ZXREGEXE_MEMORY_IMPL_H
