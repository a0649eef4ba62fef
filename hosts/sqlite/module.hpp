// The module of a table that SQL can only read, and only by its own name
// (no xCreate, so no CREATE VIRTUAL TABLE): the callbacks that such a table
// has, in one place.
//
// Include after sqlite3ext.h.
#pragma once

namespace orv::sqlite {

using Connect = decltype(sqlite3_module::xConnect);
using BestIndex = decltype(sqlite3_module::xBestIndex);
using Disconnect = decltype(sqlite3_module::xDisconnect);
using Open = decltype(sqlite3_module::xOpen);
using Close = decltype(sqlite3_module::xClose);
using Filter = decltype(sqlite3_module::xFilter);
using Next = decltype(sqlite3_module::xNext);
using Eof = decltype(sqlite3_module::xEof);
using Column = decltype(sqlite3_module::xColumn);
using Rowid = decltype(sqlite3_module::xRowid);

inline sqlite3_module readOnlyModule(Connect connect, BestIndex bestIndex, Disconnect disconnect,
                                     Open open, Close close, Filter filter, Next next, Eof eof,
                                     Column column, Rowid rowid) {
  sqlite3_module m{};
  m.xConnect = connect;
  m.xBestIndex = bestIndex;
  m.xDisconnect = disconnect;
  m.xOpen = open;
  m.xClose = close;
  m.xFilter = filter;
  m.xNext = next;
  m.xEof = eof;
  m.xColumn = column;
  m.xRowid = rowid;
  return m;
}

}  // namespace orv::sqlite
