#include "literals.h"

#include <algorithm>
#include <array>
#include <charconv>

#include "lexer.h"

namespace velkdb {
namespace {

constexpr size_t kLongestText = 64 << 20;    // near SQLite's own limits failures would differ
constexpr size_t kLongestLiftedText = 4096;  // longer ones are not kept: they hardly come twice
constexpr size_t kMostLiterals = 64;

bool IsKeyword(std::string_view word, std::string_view keyword) {
  return std::equal(
      word.begin(), word.end(), keyword.begin(), keyword.end(), [](char letter, char upper) {
        return (letter >= 'a' && letter <= 'z' ? letter - ('a' - 'A') : letter) == upper;
      });
}

/// Where the values of a kind of statement begin.
struct Form {
  std::string_view statement;
  std::string_view values;  ///< The keyword in front of them; "" for a statement without.
};
constexpr std::array kForms = {Form{"SELECT", "WHERE"}, Form{"INSERT", "VALUES"},
                               Form{"UPDATE", "SET"},   Form{"DELETE", "WHERE"},
                               Form{"BEGIN", ""},       Form{"COMMIT", ""}};

/// The one pragma that is kept compiled. Others may act while they are compiled, which would be
/// once; this one is read when it is run.
constexpr std::string_view kKeptPragma = "DATA_VERSION";

/// Keywords behind which columns get names, or expressions are compared with each other.
constexpr std::array<std::string_view, 8> kDoubtfulWords = {
    "SELECT", "VALUES", "GROUP", "HAVING", "WINDOW", "OVER", "RETURNING", "CONFLICT"};

bool IsDoubtful(std::string_view word) {
  return std::any_of(kDoubtfulWords.begin(), kDoubtfulWords.end(),
                     [word](std::string_view doubtful) { return IsKeyword(word, doubtful); });
}

/// Walks one statement.
class Lifter {
 public:
  Lifter(std::string_view sql, LiftedText &lifted) : sql_(sql), lexer_(sql), lifted_(lifted) {}

  bool Lift() {
    if (!StartStatement()) return false;
    Token previous{Token::kWord, {}};
    for (Token token = lexer_.Next(); token.kind != Token::kEnd; token = lexer_.Next()) {
      if (!Walk(token, previous)) return false;
      previous = token;
    }
    CopyUpTo(sql_.size());
    return depth_ == 0 && lifted_.text.size() <= kLongestLiftedText;
  }

 private:
  bool StartStatement() {
    const Token token = lexer_.Next();
    if (token.kind != Token::kWord) return false;
    if (IsKeyword(token.spelling, "PRAGMA")) return IsKeyword(lexer_.Next().spelling, kKeptPragma);
    const auto *found = std::find_if(kForms.begin(), kForms.end(), [&token](const Form &form) {
      return IsKeyword(token.spelling, form.statement);
    });
    if (found == kForms.end()) return false;
    form_ = *found;
    return true;
  }

  /// @return false when the statement is not sure.
  bool Walk(const Token &token, const Token &previous) {
    switch (token.kind) {
      case Token::kDoubtful:
        return false;
      case Token::kWord:
        return WalkWord(token.spelling);
      case Token::kOpen:
        ++depth_;
        return true;
      case Token::kClose:
        return depth_-- > 0;
      case Token::kText:
        return !HoldsValue(previous) || TakeText(token.spelling);
      case Token::kInteger:
        return !(HoldsValue(previous) || IsOffset(previous)) || TakeInteger(token.spelling);
      default:
        return true;
    }
  }

  bool WalkWord(std::string_view word) {
    if (!in_values_ && depth_ == 0 && IsKeyword(word, form_.values)) {
      in_values_ = true;
      return true;
    }
    // Among an INSERT's values another word starts a function or what to do on a conflict.
    if (in_values_ && IsInsert()) return IsKeyword(word, "NULL");
    return !IsDoubtful(word);
  }

  bool IsInsert() const { return form_.statement == "INSERT"; }

  /// Whether behind `previous` nothing but a value can stand.
  bool HoldsValue(const Token &previous) const {
    if (!in_values_) return false;
    if (previous.kind == Token::kComparison) return true;
    return IsInsert() && (previous.kind == Token::kOpen || previous.kind == Token::kComma);
  }

  bool IsOffset(const Token &previous) const {
    return depth_ == 0 && previous.kind == Token::kWord && IsKeyword(previous.spelling, "OFFSET");
  }

  bool TakeText(std::string_view token) {
    Literal literal{Literal::kText, token.substr(1, token.size() - 2)};
    return Replace(token, literal);
  }

  bool TakeInteger(std::string_view token) {
    Literal literal{Literal::kInteger, token};
    const char *const end = token.data() + token.size();
    const auto [stop, error] = std::from_chars(token.data(), end, literal.number);
    if (error != std::errc()) return false;  // SQLite makes a decimal of it
    const bool planner_looks = literal.number <= 1 && !IsInsert();
    return planner_looks || Replace(token, literal);
  }

  bool Replace(std::string_view token, const Literal &literal) {
    const auto start = static_cast<size_t>(token.data() - sql_.data());
    CopyUpTo(start);
    lifted_.text += '?';
    copied_ = start + token.size();
    lifted_.literals.push_back(literal);
    return lifted_.literals.size() <= kMostLiterals;
  }

  void CopyUpTo(size_t end) { lifted_.text.append(sql_, copied_, end - copied_); }

  std::string_view sql_;
  Lexer lexer_;
  LiftedText &lifted_;
  Form form_;
  size_t copied_ = 0;
  int depth_ = 0;
  bool in_values_ = false;
};

}  // namespace

bool LiftLiterals(std::string_view sql, LiftedText &lifted) {
  lifted.text.clear();
  lifted.literals.clear();
  return sql.size() <= kLongestText && Lifter(sql, lifted).Lift();
}

}  // namespace velkdb
