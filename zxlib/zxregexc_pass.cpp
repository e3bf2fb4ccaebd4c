// Loops whose passes can be empty.

#include "zxregexc_pass_impl.h"

#include "zxqva.h"

namespace zxregexc {

using zxnode::Node;

namespace {

// True if a match of the node can be empty.  Places and groups take nothing.
bool can_be_empty(Node node) {
  if (zxnode::is_repeat(node)) return zxnode::minimum(node) == 0;
  if (!zxnode::is(node, zxNodeKind::field)) return !zxnode::takes_bytes(node);
  const std::uint8_t* operand = zxnode::operand(node);
  return static_cast<std::int8_t>(operand[1]) == k_field_not_given &&
         (operand[3] & k_field_blank) != 0;
}

// The body of a loop: which nodes lead to its end without taking a byte.
// Links lead forward but for those of inner loops, which lead to where the
// loop can be left as well; so one walk from the end does it.
class Body {
 public:
  Body(Node program_begin, Node body_begin, Node body_end)
      : program(program_begin), from(body_begin), to(body_end) {
    for (Node node = from; node < to; node = zxnode::following(node))
      nodes.append(node);
  }

  bool can_pass() {
    passes_from(to) = true;
    for (std::int32_t i = nodes.length(); i-- > 0;)
      passes_from(nodes.get(i)) = find(nodes.get(i));
    return passes_from(from);
  }

 private:
  bool find(Node node) const {
    if (zxnode::is(node, zxNodeKind::back)) return leaves_loop(node);
    if (!zxnode::is(node, zxNodeKind::branch))
      return can_be_empty(node) && passes(zxnode::next(node));
    for (; node != nullptr; node = zxnode::next_alternative(node))
      if (passes(zxnode::operand(node))) return true;
    return false;
  }

  // The way out of an inner x* stands behind its BACK; that of an x+ is an
  // alternative of the same choice.
  bool leaves_loop(Node back) const {
    const Node head = zxnode::next(back);
    return zxnode::is(head, zxNodeKind::branch) && head < back &&
           zxnode::next(head) > back && passes(zxnode::next(head));
  }

  bool passes(Node node) const {
    return node != nullptr && node >= from && node <= to && passes_from(node);
  }

  bool& passes_from(Node node) const { return passing[node - program]; }

  const Node program;
  const Node from;
  const Node to;
  zxQVA<Node> nodes;

  static bool passing[32768];  // by the nodes' places
};

bool Body::passing[32768];

}  // namespace

bool EmptyPasses::ends_star(Node back) const {
  if (!can_be) return false;
  const Node branch = zxnode::next(back);
  return zxnode::is(branch, zxNodeKind::branch) &&
         zxnode::operand(branch) != back &&
         can_pass(zxnode::operand(branch), back);
}

bool EmptyPasses::ends_plus(Node branch) const {
  if (!can_be) return false;
  const Node back = zxnode::operand(branch);
  return zxnode::is(back, zxNodeKind::back) &&
         can_pass(zxnode::next(back), branch);
}

bool EmptyPasses::can_pass(Node from, Node to) const {
  return Body(program, from, to).can_pass();
}

}  // namespace zxregexc
