#ifndef VELK_VELKDB_H
#define VELK_VELKDB_H

#include <stddef.h>

#include "velk/export.h"

/// The platform's SQL connection: one SQLite file per handle.
///
/// Statements go in as text with their values in it, results come back whole:
///
///     VELKDBHandle *db = VELKDBConnect("", "", "", "/srv/app/app.db");
///     DBResult *result = NULL;
///     unsigned int row;
///     if (VELKDBExecute(db, "SELECT name FROM item", &result) == 0)
///       while (VELKDBFetchRow(result, &row) != -1) puts(VELKDBFetchField(result, row, "name"));
///     VELKDBFreeResult(result);
///     VELKDBClose(db);
///
/// A handle and its results belong to one thread at a time. A handle must not cross fork().

#ifdef __cplusplus
extern "C" {
#endif

struct sqlite3;

typedef struct VELKDBHandle_tag VELKDBHandle;  ///< One connection.
typedef struct DBResult_tag DBResult;          ///< The rows of one executed statement.

/// Opens the existing SQLite file at `path`; the first three arguments are for engines with a
/// server and are not read.
///
/// The file is never created, and not followed when its last component is a symbolic link.
/// A file that may only be read is opened for reading. Each statement waits up to 10 seconds in
/// all for other processes. The connection distrusts the schema (defensive mode on, trusted schema
/// off) and keeps `synchronous=NORMAL`. An empty file is switched to WAL. A WAL is opened here
/// already, as the account that the process now has, so that the process may change to one that
/// could not. A file that is broken is connected to; its statements fail.
///
/// Durability. In WAL mode a committed change survives the death of the process at once. It has
/// also reached the disk when VELKDBExecute() returns, unless all that its transaction wrote were
/// INSERTs and UPDATEs of tables that the file itself lists as relaxed: the rows of its table
/// `velkdb_relaxed` (`name TEXT PRIMARY KEY`). A file without that table lists nothing. The list is
/// read when the connection is made and again after this connection has changed it.
///
/// @return a handle to be closed with VELKDBClose(), or null: null or empty path, no such file,
///         no permission, a symbolic link, no memory.
VELK_PLATFORM_API VELKDBHandle *VELKDBConnect(const char *host, const char *user,
                                              const char *password, const char *path);

/// Runs every statement of `sql` in order and stops at the first that fails.
///
/// A single SELECT, INSERT, UPDATE or DELETE that differs from one of the last 64 in its values
/// alone is not compiled again. Nothing but the time tells.
///
/// @param result receives the rows of the last statement that yields columns, read to their end,
///        or null when there is none; to be freed with VELKDBFreeResult(). May be null. Is set to
///        null on failure.
/// @return 0, or -1 (null handle or text, or a statement failed: see VELKDBErrorGet()). A failed
///         call rolls back a transaction that this same call had opened, and no other. When only
///         the flush to the disk failed, the call fails although the change is committed.
VELK_PLATFORM_API int VELKDBExecute(VELKDBHandle *handle, const char *sql, DBResult **result);

/// The text of this handle's last failure; "" before the first. Never null. Owned by the handle
/// and valid until its next failure.
VELK_PLATFORM_API const char *VELKDBErrorGet(VELKDBHandle *handle);

/// Moves to the next row; the first call moves to the first.
/// @param row receives the row's index, to be handed to VELKDBFetchField(); left alone at the end.
/// @return 0, or -1 when no row is left or `result` is null.
VELK_PLATFORM_API int VELKDBFetchRow(DBResult *result, unsigned int *row);

/// The text of one column, found by its name in the statement's output (ASCII case ignored; the
/// first of equal names).
/// @return zero-terminated text owned by `result`; "" for SQL NULL, an unknown column or row, and
///         null arguments. Never null. A value that holds a zero byte appears cut there.
VELK_PLATFORM_API const char *VELKDBFetchField(DBResult *result, unsigned int row,
                                               const char *column);

/// Releases a result. Accepts null.
VELK_PLATFORM_API void VELKDBFreeResult(DBResult *result);

/// Closes the connection; an open transaction is rolled back. Results stay valid. Accepts null.
VELK_PLATFORM_API void VELKDBClose(VELKDBHandle *handle);

/// Escapes `length` bytes for use between single quotes: doubles each single quote, changes
/// nothing else, adds no quotes.
/// @param engine always 0.
/// @param out receives at most `capacity` bytes, and a terminating zero behind them when there is
///        room left for one. `capacity` = 2 × `length` always suffices for the text.
/// @return the number of bytes written without the terminator, or -1: the text does not fit, a
///         null pointer with a non-zero length, a result over INT_MAX.
VELK_PLATFORM_API int VELKDBEscapeStringEX2(int engine, char *out, size_t capacity, const char *in,
                                            size_t length);

/// The SQLite connection beneath, owned by the handle; null for a null handle. Meant for reading
/// its state (last insert id, backup source); changing its settings breaks the promises above.
VELK_PLATFORM_API struct sqlite3 *VELKDBSqlite(VELKDBHandle *handle);

#ifdef __cplusplus
}
#endif

#endif
