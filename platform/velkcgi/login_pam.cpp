#include "login_pam.h"

#include <security/pam_appl.h>

#include <cstdlib>
#include <cstring>

namespace velk {
namespace {

constexpr char kService[] = "velk";

/// Frees answers that PAM will not get to see.
void DropReplies(pam_response *replies, int count) {
  for (int i = 0; i < count; ++i) {
    if (replies[i].resp == nullptr) continue;
    explicit_bzero(replies[i].resp, strlen(replies[i].resp));
    free(replies[i].resp);
  }
  free(replies);
}

/// Answers one message.
/// @return false for a question other than the password's, or when memory is short.
bool Answer(const pam_message &message, const char *password, pam_response &reply) {
  switch (message.msg_style) {
    case PAM_PROMPT_ECHO_OFF:
      reply.resp = strdup(password);
      return reply.resp != nullptr;
    case PAM_ERROR_MSG:
    case PAM_TEXT_INFO:
      return true;
    default:
      return false;
  }
}

/// What PAM calls to ask the person at the keyboard. `data` is the password.
int Converse(int count, const pam_message **messages, pam_response **replies, void *data) {
  if (count <= 0 || count > PAM_MAX_NUM_MSG) return PAM_CONV_ERR;
  auto *answers =
      static_cast<pam_response *>(calloc(static_cast<size_t>(count), sizeof(pam_response)));
  if (answers == nullptr) return PAM_BUF_ERR;
  for (int i = 0; i < count; ++i) {
    if (Answer(*messages[i], static_cast<const char *>(data), answers[i])) continue;
    DropReplies(answers, count);
    return PAM_CONV_ERR;
  }
  if (replies == nullptr) {  // a module that only tells something may not care for an answer
    DropReplies(answers, count);
    return PAM_SUCCESS;
  }
  *replies = answers;
  return PAM_SUCCESS;
}

/// One transaction, ended with the scope.
class Transaction {
 public:
  Transaction(const char *name, const char *password)
      : conversation_{Converse, const_cast<char *>(password)} {
    outcome_ = pam_start(kService, name, &conversation_, &handle_);
  }
  Transaction(const Transaction &) = delete;
  Transaction &operator=(const Transaction &) = delete;
  ~Transaction() {
    if (handle_ != nullptr) pam_end(handle_, outcome_);
  }

  bool Check(const std::string &remote_address) {
    if (outcome_ != PAM_SUCCESS) return false;
    if (!remote_address.empty())
      outcome_ = pam_set_item(handle_, PAM_RHOST, remote_address.c_str());
    if (outcome_ == PAM_SUCCESS) outcome_ = pam_authenticate(handle_, kFlags);
    if (outcome_ == PAM_SUCCESS) outcome_ = pam_acct_mgmt(handle_, kFlags);
    return outcome_ == PAM_SUCCESS;
  }

  /// The account's name, which a module may have changed.
  std::optional<std::string> Name() const {
    const void *name = nullptr;
    if (pam_get_item(handle_, PAM_USER, &name) != PAM_SUCCESS || name == nullptr) {
      return std::nullopt;
    }
    return static_cast<const char *>(name);
  }

 private:
  static constexpr int kFlags = PAM_SILENT | PAM_DISALLOW_NULL_AUTHTOK;

  pam_conv conversation_;
  pam_handle_t *handle_ = nullptr;
  int outcome_;
};

}  // namespace

std::optional<std::string> LoginThroughPam(const char *name, const char *password,
                                           const std::string &remote_address) {
  Transaction transaction(name, password);
  if (!transaction.Check(remote_address)) return std::nullopt;
  return transaction.Name();
}

}  // namespace velk
