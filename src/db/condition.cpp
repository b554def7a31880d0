#include <string>
#include <vector>

#include "velksharing/database.h"

namespace VELK::sharing::db {

class ConditionPrivate {
 public:
  explicit ConditionPrivate(BaseDB &db) : db_(db) {}

  void Where(const std::string &expression, bool is_and) {
    if (!expression.empty()) wheres_.push_back({"", "", expression, is_and});
  }

  void Where(const std::string &column, const std::string &value, bool is_and) {
    if (!column.empty()) wheres_.push_back({column, value, "", is_and});
  }

  void OrderBy(const std::string &column, bool desc) { orders_.push_back({column, desc}); }

  void Limit(int offset, int limit) {
    offset_ = offset;
    limit_ = limit;
  }

  void Clear() {
    wheres_.clear();
    orders_.clear();
    Limit(kUnset, kUnset);
  }

  bool IsEmpty() const {
    return wheres_.empty() && orders_.empty() && offset_ == kUnset && limit_ == kUnset;
  }

  std::string GetSQL() const {
    std::string sql;
    AppendWheres(sql);
    AppendOrders(sql);
    if (limit_ > 0) sql += " LIMIT " + std::to_string(limit_);
    if (offset_ > 0) sql += " OFFSET " + std::to_string(offset_);
    return sql;
  }

 private:
  struct Term {
    std::string column;  ///< Compared with `value`, unless empty.
    std::string value;
    std::string expression;  ///< Used when `column` is empty.
    bool is_and;             ///< Joined to the terms before with AND, else with OR.
  };

  struct Order {
    std::string column;
    bool desc;
  };

  static constexpr int kUnset = -1;

  void AppendWheres(std::string &sql) const {
    const char *joiner = " WHERE ";
    for (const Term &term : wheres_) {
      if (&term != &wheres_.front()) joiner = term.is_and ? " AND " : " OR ";
      sql += joiner;
      AppendTerm(sql, term);
    }
  }

  void AppendTerm(std::string &sql, const Term &term) const {
    if (term.column.empty()) {
      sql += term.expression;
    } else {
      sql += "`" + db_.Escape(term.column) + "` = '" + db_.Escape(term.value) + "'";
    }
  }

  void AppendOrders(std::string &sql) const {
    for (const Order &order : orders_) {
      sql += &order == &orders_.front() ? " ORDER BY " : ",";
      sql += db_.Escape(order.column) + (order.desc ? " DESC" : " ASC");
    }
  }

  BaseDB &db_;
  std::vector<Term> wheres_;
  std::vector<Order> orders_;
  int offset_ = kUnset;
  int limit_ = kUnset;
};

Condition::Condition(BaseDB &db) : private_(std::make_unique<ConditionPrivate>(db)) {}
Condition::~Condition() = default;

Condition &Condition::Where(const std::string &expression) {
  private_->Where(expression, true);
  return *this;
}

Condition &Condition::Where(const std::string &column, const std::string &value) {
  private_->Where(column, value, true);
  return *this;
}

Condition &Condition::OrWhere(const std::string &expression) {
  private_->Where(expression, false);
  return *this;
}

Condition &Condition::OrWhere(const std::string &column, const std::string &value) {
  return Where(column, value);
}

Condition &Condition::OrderBy(const std::string &column, bool desc) {
  private_->OrderBy(column, desc);
  return *this;
}

Condition &Condition::Limit(int offset, int limit) {
  private_->Limit(offset, limit);
  return *this;
}

Condition &Condition::Page(int page, int size) {
  // In the unsigned numbers a page far out wraps instead of overflowing.
  const auto offset = (static_cast<unsigned int>(page) - 1) * static_cast<unsigned int>(size);
  return Limit(static_cast<int>(offset), size);
}

Condition &Condition::Clear() {
  private_->Clear();
  return *this;
}

bool Condition::IsEmpty() {
  return private_->IsEmpty();
}

std::string Condition::GetSQL() const {
  return private_->GetSQL();
}

}  // namespace VELK::sharing::db
