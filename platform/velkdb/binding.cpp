#include "binding.h"

#include <sqlite3.h>

#include <string>

namespace velkdb {
namespace {

constexpr char kQuote = '\'';

std::string WithQuotesSingle(std::string_view spelling) {
  std::string text;
  text.reserve(spelling.size());
  for (size_t i = 0; i < spelling.size(); ++i) {
    text += spelling[i];
    if (spelling[i] == kQuote) ++i;
  }
  return text;
}

int BindText(sqlite3_stmt *statement, int index, std::string_view text,
             sqlite3_destructor_type keeping) {
  return sqlite3_bind_text64(statement, index, text.data(), text.size(), keeping, SQLITE_UTF8);
}

int Bind(sqlite3_stmt *statement, int index, const Literal &value) {
  if (value.kind == Literal::kInteger) return sqlite3_bind_int64(statement, index, value.number);
  if (value.spelling.find(kQuote) == std::string_view::npos)
    return BindText(statement, index, value.spelling, SQLITE_STATIC);
  return BindText(statement, index, WithQuotesSingle(value.spelling), SQLITE_TRANSIENT);
}

int BindAll(sqlite3_stmt *statement, const std::vector<Literal> &values) {
  int index = 0;
  for (const Literal &value : values) {
    const int outcome = Bind(statement, ++index, value);
    if (outcome != SQLITE_OK) return outcome;
  }
  return SQLITE_OK;
}

}  // namespace

BindingScope::BindingScope(sqlite3_stmt *statement, const std::vector<Literal> &values)
    : statement_(statement), outcome_(BindAll(statement, values)) {}

BindingScope::~BindingScope() {
  sqlite3_reset(statement_);
  sqlite3_clear_bindings(statement_);
}

}  // namespace velkdb
