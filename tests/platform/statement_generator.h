#ifndef TESTS_PLATFORM_STATEMENT_GENERATOR_H
#define TESTS_PLATFORM_STATEMENT_GENERATOR_H

#include <random>
#include <string>
#include <vector>

namespace velk_test {

/// Makes SQL at random, the same for the same seed: the statements that the sharing library sends,
/// others of their kind, odd ones, wrong ones and changes of the schema. They are for a sharing
/// database that holds the tables of Setup() too.
class StatementGenerator {
 public:
  explicit StatementGenerator(unsigned int seed) : random_(seed) {}

  /// Makes or replaces the table that the odd statements are about.
  static std::string Setup();

  /// A text of mostly one statement.
  std::string Next();
  /// A change of the schema, to be run beside Next()'s, also by another connection.
  std::string SchemaChange();

 private:
  using Choices = std::vector<const char *>;

  bool Chance(int percent) { return Below(100) < percent; }
  int Below(int limit) { return static_cast<int>(random_() % static_cast<unsigned int>(limit)); }
  std::string Pick(const Choices &choices);
  std::string Number(int limit) { return std::to_string(Below(limit)); }

  std::string LibraryStatement();
  std::string LinkValues(const char *separator, bool with_names);
  std::string Purge();
  std::string Listing();

  std::string OddStatement();
  std::string Select();
  std::string Insert();
  std::string Update();
  std::string Delete();
  std::string Where();
  std::string Tail();
  std::string Term();
  std::string Value();
  std::string Column();

  std::string Rare();
  std::string Spoil(std::string sql);

  std::mt19937 random_;
};

}  // namespace velk_test

#endif
