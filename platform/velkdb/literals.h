#ifndef VELKDB_LITERALS_H
#define VELKDB_LITERALS_H

#include <string>
#include <string_view>
#include <vector>

namespace velkdb {

/// A value that stood in a statement's text.
struct Literal {
  enum Kind { kText, kInteger };

  Kind kind;
  /// Part of the statement's text: what stands between the quotes, where '' means one quote, or
  /// the digits.
  std::string_view spelling;
  long long number = 0;  ///< Of an integer.
};

/// A statement's text with `?` in the place of values, and the values.
struct LiftedText {
  std::string text;
  std::vector<Literal> literals;  ///< In the order of their `?`.
};

/// Lifts string and integer literals out of one SELECT, INSERT, UPDATE or DELETE, so that
/// statements which differ in their values alone share one text. BEGIN, COMMIT and PRAGMA
/// data_version have none.
///
/// Takes only literals whose place can hold nothing but a value: those behind a comparison or an
/// assignment, the items of VALUES, the number of OFFSET. Others stay: they may name a column
/// (SELECT 'a'), a table ('item'.id) or a place (ORDER BY 2), and the planner looks at the number
/// of LIMIT and at comparisons with 0 and 1.
/// @param sql holds no zero byte.
/// @param lifted replaced; its literals refer to `sql`. Left in any state on failure.
/// @return false when it is not sure of the statement; that is to run as it came. Neither a script
///         nor a text with comments, parameters, blobs, decimals or anything else rare is sure.
bool LiftLiterals(std::string_view sql, LiftedText &lifted);

}  // namespace velkdb

#endif
