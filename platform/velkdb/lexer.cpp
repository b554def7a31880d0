#include "lexer.h"

namespace velkdb {
namespace {

bool IsBlank(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\f' || c == '\r';
}

bool IsDigit(char c) {
  return c >= '0' && c <= '9';
}

bool IsLetter(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_';
}

}  // namespace

Token Lexer::Next() {
  while (IsBlank(Peek())) ++at_;
  const size_t start = at_;
  if (start == text_.size()) return {Token::kEnd, {}};
  const char first = text_[at_++];
  const Token::Kind kind = Read(first);
  return {kind, text_.substr(start, at_ - start)};
}

Token::Kind Lexer::Read(char first) {
  if (IsLetter(first)) return ReadWord();
  if (IsDigit(first)) return ReadInteger();
  switch (first) {
    case '\'':
      return ReadQuoted(first, Token::kText);
    case '"':
    case '`':
      return ReadQuoted(first, Token::kName);
    case '(':
      return Token::kOpen;
    case ')':
      return Token::kClose;
    case ',':
      return Token::kComma;
    default:
      return ReadOperator(first);
  }
}

Token::Kind Lexer::ReadWord() {
  const size_t start = at_ - 1;
  while (IsLetter(Peek()) || IsDigit(Peek())) ++at_;
  // x'00' is a blob.
  const bool is_blob = at_ - start == 1 && (text_[start] | ' ') == 'x' && Peek() == '\'';
  return is_blob || GoesOn() ? Token::kDoubtful : Token::kWord;
}

Token::Kind Lexer::ReadInteger() {
  while (IsDigit(Peek())) ++at_;
  // Decimals, exponents, hexadecimals, and what is no number at all.
  return Peek() == '.' || GoesOn() ? Token::kDoubtful : Token::kInteger;
}

Token::Kind Lexer::ReadQuoted(char quote, Token::Kind kind) {
  do {
    const size_t end = text_.find(quote, at_);
    if (end == std::string_view::npos) return Token::kDoubtful;
    at_ = end + 1;
  } while (Take(quote));  // doubled, it stands for itself
  return GoesOn() ? Token::kDoubtful : kind;
}

Token::Kind Lexer::ReadOperator(char first) {
  switch (first) {
    case '=':
      Take('=');
      return Token::kComparison;
    case '<':
      if (Take('<')) return Token::kOperator;
      if (!Take('=')) Take('>');
      return Token::kComparison;
    case '>':
      if (Take('>')) return Token::kOperator;
      Take('=');
      return Token::kComparison;
    case '!':
      return Take('=') ? Token::kComparison : Token::kDoubtful;
    case '-':  // not a comment, not an arrow
      return Peek() == '-' || Peek() == '>' ? Token::kDoubtful : Token::kOperator;
    case '/':  // not a comment
      return Peek() == '*' ? Token::kDoubtful : Token::kOperator;
    case '.':  // not a decimal
      return IsDigit(Peek()) ? Token::kDoubtful : Token::kOperator;
    case '+':
    case '*':
    case '%':
    case '|':
    case '&':
    case '~':
      return Token::kOperator;
    default:
      return Token::kDoubtful;
  }
}

bool Lexer::GoesOn() const {
  return IsLetter(Peek()) || IsDigit(Peek()) || Peek() == '$' || (Peek() & '\x80') != 0;
}

bool Lexer::Take(char expected) {
  if (Peek() != expected) return false;
  ++at_;
  return true;
}

}  // namespace velkdb
