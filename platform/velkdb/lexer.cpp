#include "lexer.h"

#include <array>

namespace velkdb {
namespace {

enum CharacterClass : unsigned char {
  kOtherCharacter,
  kBlank,
  kDigit,
  kLetter,      ///< In ASCII; the underscore is one.
  kWordBeyond,  ///< Goes on with a word or starts one, which is not looked into: $, beyond ASCII.
};

constexpr std::array<CharacterClass, 256> MakeClasses() {
  std::array<CharacterClass, 256> classes{};
  for (const unsigned char c : {' ', '\t', '\n', '\f', '\r'}) classes[c] = kBlank;
  for (unsigned char c = '0'; c <= '9'; ++c) classes[c] = kDigit;
  for (unsigned char c = 'a'; c <= 'z'; ++c) classes[c] = classes[c - ('a' - 'A')] = kLetter;
  classes['_'] = kLetter;
  classes['$'] = kWordBeyond;
  for (size_t c = 0x80; c < classes.size(); ++c) classes[c] = kWordBeyond;
  return classes;
}

constexpr std::array<CharacterClass, 256> kClasses = MakeClasses();

CharacterClass ClassOf(char c) {
  return kClasses[static_cast<unsigned char>(c)];
}

/// Most of a statement is words.
size_t EndOfWord(std::string_view text, size_t at) {
  const auto goes_on = [](char c) { return ClassOf(c) == kLetter || ClassOf(c) == kDigit; };
  while (at < text.size() && goes_on(text[at])) ++at;
  return at;
}

}  // namespace

Token Lexer::Next() {
  while (ClassOf(Peek()) == kBlank) ++at_;
  const size_t start = at_;
  if (start == text_.size()) return {Token::kEnd, {}};
  const char first = text_[at_++];
  const Token::Kind kind = Read(first);
  return {kind, text_.substr(start, at_ - start)};
}

Token::Kind Lexer::Read(char first) {
  if (ClassOf(first) == kLetter) return ReadWord();
  if (ClassOf(first) == kDigit) return ReadInteger();
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
  at_ = EndOfWord(text_, at_);
  // x'00' is a blob.
  const bool is_blob = at_ - start == 1 && (text_[start] | ' ') == 'x' && Peek() == '\'';
  return is_blob || GoesOn() ? Token::kDoubtful : Token::kWord;
}

Token::Kind Lexer::ReadInteger() {
  while (ClassOf(Peek()) == kDigit) ++at_;
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
      return ClassOf(Peek()) == kDigit ? Token::kDoubtful : Token::kOperator;
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
  return ClassOf(Peek()) >= kDigit;
}

bool Lexer::Take(char expected) {
  if (Peek() != expected) return false;
  ++at_;
  return true;
}

}  // namespace velkdb
