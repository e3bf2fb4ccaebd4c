// What can be met behind a choice.

#include "zxregexc_outlook_impl.h"

#include <string_view>

namespace zxregexc {

using zxnode::Node;

namespace {

// Nodes that take nothing: what stands behind them can still be met.
bool is_passed(Node node) {
  switch (static_cast<zxNodeKind>(*node)) {
    case zxNodeKind::bol:
    case zxNodeKind::wordb:
    case zxNodeKind::nwordb:
    case zxNodeKind::nothing:
    case zxNodeKind::back:
    case zxNodeKind::close0:
    case zxNodeKind::star:
    case zxNodeKind::starmin:
    case zxNodeKind::curly:
    case zxNodeKind::curlymin:
      return true;
    default:
      return zxnode::is_close(node);
  }
}

void add_text(ByteSet& set, std::string_view bytes) {
  for (const char c : bytes) set.add(static_cast<unsigned char>(c));
}

}  // namespace

Outlook::Outlook(Node node, Purpose purpose, bool program_has_loops)
    : is_free(purpose == Purpose::last_try),
      may_open(purpose != Purpose::choice || !program_has_loops),
      is_ahead_of_choices(purpose == Purpose::start) {
  is_known = walk(node, false);
  if (!is_known) bytes = k_all_bytes;
}

// `is_own`: the current group has been opened on the way, so that its count
// is written again before a later try reads it.
bool Outlook::walk(Node node, bool is_own) {
  while (budget-- > 0) {
    if (zxnode::is_open(node)) {
      if (!may_open) return false;
      is_own = true;
    } else if (zxnode::is(node, zxNodeKind::open0)) {
      is_own = false;
    } else if (zxnode::is(node, zxNodeKind::branch)) {
      if (zxnode::next_alternative(node) != nullptr)
        return walk_choice(node, is_own);
      node = zxnode::operand(node);
      continue;
    } else if (takes_byte(node)) {
      return true;
    } else if (!is_passed(node)) {
      return false;
    }
    node = zxnode::next(node);
  }
  return false;
}

bool Outlook::walk_choice(Node branch, bool is_own) {
  // A count that every try writes first is nobody's to read.
  if (is_ahead_of_choices && !is_own) is_free = true;
  is_ahead_of_choices = false;
  if (!is_own && !is_free) return false;
  for (; branch != nullptr; branch = zxnode::next_alternative(branch))
    if (!walk(zxnode::operand(branch), is_own)) return false;
  return true;
}

// Adds what the node takes; true if the way ends here.
bool Outlook::takes_byte(Node node) {
  if (zxnode::is_repeat(node)) {
    bytes.add(first_set(zxnode::repeated(node)));
    return zxnode::minimum(node) > 0;
  }
  if (zxnode::is(node, zxNodeKind::eol)) return at_end = true;
  if (zxnode::is(node, zxNodeKind::field)) return takes_field(node);
  if (!zxnode::takes_bytes(node)) return false;
  bytes.add(first_set(node));
  return true;
}

bool Outlook::takes_field(Node node) {
  const std::uint8_t* operand = zxnode::operand(node);
  const unsigned flags = operand[3];
  if ((flags & k_field_blank) != 0) return false;
  if ((flags & k_field_zero) == 0) bytes.add(' ');
  switch (operand[4]) {
    case 'x':
      add_text(bytes, "abcdefABCDEF+-0123456789");
      break;
    case 'f':
    case 'v':
      bytes.add('.');
      [[fallthrough]];
    case 'd':
      add_text(bytes, "+-0123456789");
      break;
    case 't':
      add_text(bytes, "0123456789");
      break;
    case 'C':
      add_text(bytes, "\"~'");
      break;
    default:
      bytes = k_all_bytes;
      break;
  }
  return true;
}

}  // namespace zxregexc
