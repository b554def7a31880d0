#ifndef VELKSHARING_WEB_SHARE_BYTE_RANGE_H
#define VELKSHARING_WEB_SHARE_BYTE_RANGE_H

#include <sys/types.h>

#include <string_view>

namespace web::share {

/// What a Range field asks for.
struct ByteRange {
  enum class Kind {
    WHOLE,          ///< Everything: no range, none that we understand, or several.
    PART,           ///< `length` bytes from `offset`.
    UNSATISFIABLE,  ///< Only what lies behind the end.
  };

  Kind kind = Kind::WHOLE;
  off_t offset = 0;
  off_t length = 0;
};

/// @param field the Range field's value; "" for none.
/// @param size of the file, in bytes.
ByteRange ParseRange(std::string_view field, off_t size);

}  // namespace web::share

#endif
