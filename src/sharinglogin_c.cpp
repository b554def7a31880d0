#include "velksharing/access.h"

// The flat forms: no exception leaves them, and arguments that their C++ twins could not take are
// answered with the failure code.

namespace {

template <typename Call>
int NoThrow(int failure, Call call) noexcept {
  try {
    return call();
  } catch (...) {
    return failure;
  }
}

}  // namespace

int VelkSharingLogin(char *session_id_buf, size_t buf_size,
                     const struct _tag_sharing_login_params *params, int keep_block_state) {
  if (session_id_buf == nullptr || buf_size == 0) return VELK_SHARING_LOGIN_UNUSABLE;
  std::string session_id;
  const int result = NoThrow(VELK_SHARING_LOGIN_UNUSABLE, [&] {
    return VELK::VelkSharingLogin(session_id, params, keep_block_state == 1);
  });
  session_id.copy(session_id_buf, buf_size);
  session_id_buf[buf_size - 1] = '\0';
  return result;
}

int VelkSharingIsAuthorized(const struct _tag_sharing_login_params *params) {
  return NoThrow(VELK_SHARING_AUTH_UNUSABLE, [&] { return VELK::VelkSharingIsAuthorized(params); });
}

int VelkSharingLogout(const char *hash, const char *session_id) {
  if (hash == nullptr || session_id == nullptr) return 0;
  return NoThrow(0, [&] { return VELK::VelkSharingLogout(hash, session_id); });
}

int VelkSharingIncreaseUseCount(const char *hash) {
  if (hash == nullptr) return 0;
  return NoThrow(0, [&] { return VELK::VelkSharingIncreaseUseCount(hash); });
}
