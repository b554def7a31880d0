#ifndef VELKSHARING_WEB_HTTP_FORM_H
#define VELKSHARING_WEB_HTTP_FORM_H

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace web {

/// The fields of a form or of a query: "name=value&other=value", where a plus sign is a blank.
/// What it holds may be a password, so it is wiped at the end of the scope.
///
///     const std::optional<Form> form = Form::Parse(request.body);
///     if (!form) return BadRequest();
///     const std::string *password = form->Find("password");
class Form {
 public:
  using Field = std::pair<std::string, std::string>;  ///< Name and value, decoded.

  static constexpr size_t kMostFields = 1000;

  /// A form without fields.
  Form() = default;
  Form(const Form &) = delete;
  Form(Form &&other) noexcept = default;
  Form &operator=(const Form &) = delete;
  Form &operator=(Form &&other) = delete;
  ~Form();

  /// @return nothing for a broken escape, a zero byte (encoded or not), and for more than
  ///         kMostFields fields. A field without "=" has the value "".
  static std::optional<Form> Parse(std::string_view encoded);

  /// The first value of a name; null when there is none. Valid as long as the form.
  const std::string *Find(std::string_view name) const;
  /// Whether there is a field of this name, whatever its value.
  bool Has(std::string_view name) const { return Find(name) != nullptr; }
  /// Every value of a name, in order.
  std::vector<std::string> All(std::string_view name) const;

 private:
  std::vector<Field> fields_;
};

}  // namespace web

#endif
