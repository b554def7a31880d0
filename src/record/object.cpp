#include "velksharing/record.h"

namespace VELK::sharing::record {

Object::Object() = default;
Object::Object(const Object &other) = default;
Object &Object::operator=(const Object &other) = default;
Object::~Object() = default;

}  // namespace VELK::sharing::record
