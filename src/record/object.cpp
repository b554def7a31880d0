#include "velksharing/record.h"

namespace VELK {
namespace sharing {
namespace record {

Object::Object() = default;
Object::Object(const Object &other) = default;
Object &Object::operator=(const Object &other) = default;
Object::~Object() = default;

}  // namespace record
}  // namespace sharing
}  // namespace VELK
