// vtxwrite.cpp - puts a table of securities to disk.
// Tests: tests/obautil/vtxwrite_test.cpp.
#include "vtxwrite.h"

#include <cstdlib>

#include "zxbfile.h"
#include "zxsys2.h"

namespace {

struct State {
  zxBFile out;
  zxStr index_name;  // temporary names; empty if there is no such file
  zxStr data_name;
  bool handler_is_set = false;
};
constinit State state;

void set_handler() {
  if (!state.handler_is_set) std::atexit(clear_unfinished_vtx);
  state.handler_is_set = true;
}

// Creates a file beside the final ones.  Its name is kept once it is there.
void create_temporary(const zxStr& directory, zxStr& name) {
  const zxStr chosen = uniqfile(directory, "tmp");
  state.out.create_new(chosen);
  if (state.out.is_open()) name = chosen;
}

template <class T>
void write_items(const zxQVA<T>& items) {
  if (items.length() > 0)
    state.out.write(&items.get(0),
                    items.length() * static_cast<std::int32_t>(sizeof(T)));
}

// Writes a head and what follows it; true if all of it is on its way to the
// system, false behind a failure that was dropped.
template <class Head, class T>
bool write_file(const zxStr& directory, const Head& head, const zxQVA<T>& items,
                zxStr& name) {
  create_temporary(directory, name);
  if (!state.out.is_open()) return false;
  state.out.write(&head, sizeof head);
  write_items(items);
  const bool is_complete = !state.out.handle->error();
  if (state.out.close()) return is_complete;
  bail_code(1010, name);
  return false;
}

bool write_data(const VtxTable& table, const zxStr& directory) {
  return write_file(directory, table.head, table.records, state.data_name);
}

bool write_index(const VtxTable& table, const zxStr& directory) {
  const VtxIndexHead head = {VtxIndexHead::k_magic,
                             static_cast<std::int16_t>(table.entries.length())};
  return write_file(directory, head, table.entries, state.index_name);
}

void move_temporary(zxStr& name, const zxStr& final_name) {
  move_file(name, final_name);
  name.clear();
}

void drop_temporary(zxStr& name) {
  if (!name.is_empty()) try_delete(name);
  name.clear();
}

}  // namespace

void write_vtx_table(const VtxTable& table, const zxStr& directory,
                     const VtxFileNames& names) {
  if (!ZX_ASSERT(table.entries.length() <= VtxTable::k_max_entries)) return;
  set_handler();
  const zxStr place = with_slash(directory);
  if (!write_data(table, place) || !write_index(table, place))
    return clear_unfinished_vtx();
  move_temporary(state.data_name, place + names.data);
  move_temporary(state.index_name, place + names.index);
}

void clear_unfinished_vtx() {
  state.out.close();  // an open file can't be deleted everywhere
  drop_temporary(state.data_name);
  drop_temporary(state.index_name);
}
