#ifndef VELKDB_LEXER_H
#define VELKDB_LEXER_H

#include <cstddef>
#include <string_view>

namespace velkdb {

/// A piece of an SQL text.
struct Token {
  enum Kind {
    kEnd,
    kWord,        ///< A keyword, or a name without quotes.
    kName,        ///< Between double quotes or backquotes.
    kText,        ///< Between single quotes.
    kInteger,     ///< Decimal digits alone.
    kComparison,  ///< = == < <= > >= <> !=
    kOpen,
    kClose,
    kComma,
    kOperator,  ///< Any other that may stand in an expression.
    kDoubtful   ///< All else: where SQLite would split the text, or what it means, is left open.
  };

  Kind kind;
  std::string_view spelling;
};

/// Splits an SQL text as SQLite does, as far as that is simple; the rest is doubtful.
class Lexer {
 public:
  explicit Lexer(std::string_view text) : text_(text) {}

  /// The next token; not to be called any more after the end or a doubtful one.
  Token Next();

 private:
  Token::Kind Read(char first);
  Token::Kind ReadWord();
  Token::Kind ReadInteger();
  Token::Kind ReadQuoted(char quote, Token::Kind kind);
  Token::Kind ReadOperator(char first);
  /// Whether a letter, a digit or what SQLite counts as one is next: then what stands before it is
  /// no number, or in its place a `?` would make another parameter of it.
  bool GoesOn() const;
  bool Take(char expected);
  char Peek() const { return at_ < text_.size() ? text_[at_] : '\0'; }

  std::string_view text_;
  size_t at_ = 0;
};

}  // namespace velkdb

#endif
