#include "fault/platform_override.h"

#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <type_traits>

namespace velk_test {
namespace {

/// The function of this name in the libraries behind this program.
template <typename Function>
Function *Next(const char *symbol) {
  void *found = dlsym(RTLD_NEXT, symbol);
  if (found == nullptr) {
    fprintf(stderr, "no %s to fall back on\n", symbol);
    abort();
  }
  return reinterpret_cast<Function *>(found);
}

template <typename Result, typename... Parameters>
Result Run(const std::function<Result(Parameters...)> &in_place,
           Result (*real_function)(Parameters...), std::type_identity_t<Parameters>... arguments) {
  if (!in_place) return real_function(arguments...);
  const auto kept = in_place;  // it may take itself out of force
  return kept(arguments...);
}

using VELK::RANDOM::VELKRandom;
using VELK::RANDOM::VELKRandomBase;

// Members of classes, as the functions that they are beneath.
const char *const random_text_symbol =
    "_ZN4VELK6RANDOM10VELKRandom9getString"
    "ERKNSt7__cxx1112basic_stringIcSt11char_traitsIcESaIcEEEjRS7_";
const char *const random_number_symbol = "_ZN4VELK6RANDOM14VELKRandomBase6randomEii";

}  // namespace

PlatformOverrides &Overrides() {
  static PlatformOverrides overrides;
  return overrides;
}

namespace real {

VELKDBHandle *DbConnect(const char *host, const char *user, const char *password,
                        const char *path) {
  static auto *const next = Next<decltype(::VELKDBConnect)>("VELKDBConnect");
  return next(host, user, password, path);
}

int DbExecute(VELKDBHandle *handle, const char *sql, DBResult **result) {
  static auto *const next = Next<decltype(::VELKDBExecute)>("VELKDBExecute");
  return next(handle, sql, result);
}

int DbEscape(int engine, char *out, size_t capacity, const char *in, size_t length) {
  static auto *const next = Next<decltype(::VELKDBEscapeStringEX2)>("VELKDBEscapeStringEX2");
  return next(engine, out, capacity, in, length);
}

void DbClose(VELKDBHandle *handle) {
  static auto *const next = Next<decltype(::VELKDBClose)>("VELKDBClose");
  next(handle);
}

int FileExist(const char *path) {
  static auto *const next = Next<decltype(::VLIBCFileExist)>("VLIBCFileExist");
  return next(path);
}

int FileTouch(const char *path) {
  static auto *const next = Next<decltype(::VLIBCFileTouch)>("VLIBCFileTouch");
  return next(path);
}

int AclChmod(const char *path, int reserved, unsigned int mode) {
  static auto *const next = Next<decltype(::VELKFSAclChmod)>("VELKFSAclChmod");
  return next(path, reserved, mode);
}

int UserGet(const char *name, VELKUSER **user) {
  static auto *const next = Next<decltype(::VELKUserGet)>("VELKUserGet");
  return next(name, user);
}

int UserGetByUid(unsigned int uid, VELKUSER **user) {
  static auto *const next = Next<decltype(::VELKUserGetByUID)>("VELKUserGetByUID");
  return next(uid, user);
}

void UserFree(VELKUSER *user) {
  static auto *const next = Next<decltype(::VELKUserFree)>("VELKUserFree");
  next(user);
}

int LoginNameConvert(const char *name, char *out, size_t capacity) {
  static auto *const next = Next<decltype(::VELKUserLoginNameConvert)>("VELKUserLoginNameConvert");
  return next(name, out, capacity);
}

int RealNameGet(const char *name, char *out, size_t capacity) {
  static auto *const next = Next<decltype(::VLIBUserRealNameGet)>("VLIBUserRealNameGet");
  return next(name, out, capacity);
}

int GroupGetGid(const char *name, unsigned int *gid) {
  static auto *const next = Next<decltype(::VELKGroupGetGID)>("VELKGroupGetGID");
  return next(name, gid);
}

int GroupGetByGid(unsigned int gid, VELKGROUP **group) {
  static auto *const next = Next<decltype(::VELKGroupGetByGID)>("VELKGroupGetByGID");
  return next(gid, group);
}

void GroupFree(VELKGROUP *group) {
  static auto *const next = Next<decltype(::VELKGroupFree)>("VELKGroupFree");
  next(group);
}

VLIBCSzHash *GroupInfo(const char *user, int arg1, int arg2) {
  static auto *const next = Next<decltype(::VLIBGroupInfoHashGet)>("VLIBGroupInfoHashGet");
  return next(user, arg1, arg2);
}

const char *ListName(const VLIBCSzHash *list, size_t index, int *end) {
  static auto *const next = Next<decltype(::VLIBCSzHashName)>("VLIBCSzHashName");
  return next(list, index, end);
}

void ListFree(VLIBCSzHash *list) {
  static auto *const next = Next<decltype(::VLIBCSzHashFree)>("VLIBCSzHashFree");
  next(list);
}

int AutoBlockFail(const char *ip, const char *category) {
  static auto *const next = Next<decltype(::AutoBlockFailLoginSet)>("AutoBlockFailLoginSet");
  return next(ip, category);
}

int AutoBlockReset(const char *ip) {
  static auto *const next = Next<decltype(::VELKAutoBlockResetByIP)>("VELKAutoBlockResetByIP");
  return next(ip);
}

int FqdnToNetbios(const char *name, char *out, size_t capacity) {
  static auto *const next =
      Next<decltype(::VELKWinsUserNameFqdn2Netbios)>("VELKWinsUserNameFqdn2Netbios");
  return next(name, out, capacity);
}

int CgiInit(VelkCgi **cgi, const char *reserved) {
  static auto *const next = Next<decltype(::VelkCgiInit)>("VelkCgiInit");
  return next(cgi, reserved);
}

int CgiLoadInCookies(VelkCgi *cgi) {
  static auto *const next = Next<decltype(::VelkCgiLoadInCookies)>("VelkCgiLoadInCookies");
  return next(cgi);
}

const char *CgiParam(VelkCgi *cgi, const char *name, const char *fallback) {
  static auto *const next = Next<decltype(::VelkCgiGetRequestParam)>("VelkCgiGetRequestParam");
  return next(cgi, name, fallback);
}

int CgiSetCookies(VelkCgi *cgi, const char *name, const char *value, long expires, const char *path,
                  const char *domain, int secure) {
  static auto *const next = Next<decltype(::VelkCgiSetCookies)>("VelkCgiSetCookies");
  return next(cgi, name, value, expires, path, domain, secure);
}

int CgiLogin(VelkCgi *cgi, char *name_out, size_t capacity, VelkCgiLoginRecord *record) {
  static auto *const next = Next<decltype(::VelkCgiLogin)>("VelkCgiLogin");
  return next(cgi, name_out, capacity, record);
}

int CgiRemoteIp(char *out, size_t capacity) {
  static auto *const next = Next<decltype(::VelkCgiGetRemoteIP)>("VelkCgiGetRemoteIP");
  return next(out, capacity);
}

int CgiIsDeniedIp(const char *ip) {
  static auto *const next = Next<decltype(::VelkCgiIsDeniedIP)>("VelkCgiIsDeniedIP");
  return next(ip);
}

void CgiFree(VelkCgi *cgi) {
  static auto *const next = Next<decltype(::VelkCgiFree)>("VelkCgiFree");
  next(cgi);
}

bool RandomText(const std::string &pool, unsigned int length, std::string &out) {
  static auto *const next =
      Next<bool(VELKRandom *, const std::string &, unsigned int, std::string &)>(
          random_text_symbol);
  VELKRandom random;
  return next(&random, pool, length, out);
}

int RandomNumber(int low, int high) {
  static auto *const next = Next<int(VELKRandomBase *, int, int)>(random_number_symbol);
  VELKRandomBase random;
  return next(&random, low, high);
}

time_t Clock() {
  static auto *const next = Next<time_t(time_t *)>("time");
  return next(nullptr);
}

}  // namespace real
}  // namespace velk_test

using velk_test::Overrides;
using velk_test::Run;
namespace real = velk_test::real;

extern "C" {

VELKDBHandle *VELKDBConnect(const char *host, const char *user, const char *password,
                            const char *path) {
  return Run(Overrides().db_connect, real::DbConnect, host, user, password, path);
}

int VELKDBExecute(VELKDBHandle *handle, const char *sql, DBResult **result) {
  return Run(Overrides().db_execute, real::DbExecute, handle, sql, result);
}

int VELKDBEscapeStringEX2(int engine, char *out, size_t capacity, const char *in, size_t length) {
  return Run(Overrides().db_escape, real::DbEscape, engine, out, capacity, in, length);
}

void VELKDBClose(VELKDBHandle *handle) {
  Run(Overrides().db_close, real::DbClose, handle);
}

int VLIBCFileExist(const char *path) {
  return Run(Overrides().file_exist, real::FileExist, path);
}

int VLIBCFileTouch(const char *path) {
  return Run(Overrides().file_touch, real::FileTouch, path);
}

int VELKFSAclChmod(const char *path, int reserved, unsigned int mode) {
  return Run(Overrides().acl_chmod, real::AclChmod, path, reserved, mode);
}

int VELKUserGet(const char *name, VELKUSER **user) {
  return Run(Overrides().user_get, real::UserGet, name, user);
}

int VELKUserGetByUID(unsigned int uid, VELKUSER **user) {
  return Run(Overrides().user_get_by_uid, real::UserGetByUid, uid, user);
}

void VELKUserFree(VELKUSER *user) {
  Run(Overrides().user_free, real::UserFree, user);
}

int VELKUserLoginNameConvert(const char *name, char *out, size_t capacity) {
  return Run(Overrides().login_name_convert, real::LoginNameConvert, name, out, capacity);
}

int VLIBUserRealNameGet(const char *name, char *out, size_t capacity) {
  return Run(Overrides().real_name_get, real::RealNameGet, name, out, capacity);
}

int VELKGroupGetGID(const char *name, unsigned int *gid) {
  return Run(Overrides().group_get_gid, real::GroupGetGid, name, gid);
}

int VELKGroupGetByGID(unsigned int gid, VELKGROUP **group) {
  return Run(Overrides().group_get_by_gid, real::GroupGetByGid, gid, group);
}

void VELKGroupFree(VELKGROUP *group) {
  Run(Overrides().group_free, real::GroupFree, group);
}

VLIBCSzHash *VLIBGroupInfoHashGet(const char *user, int arg1, int arg2) {
  return Run(Overrides().group_info, real::GroupInfo, user, arg1, arg2);
}

const char *VLIBCSzHashName(const VLIBCSzHash *list, size_t index, int *end) {
  return Run(Overrides().list_name, real::ListName, list, index, end);
}

void VLIBCSzHashFree(VLIBCSzHash *list) {
  Run(Overrides().list_free, real::ListFree, list);
}

int AutoBlockFailLoginSet(const char *ip, const char *category) {
  return Run(Overrides().auto_block_fail, real::AutoBlockFail, ip, category);
}

int VELKAutoBlockResetByIP(const char *ip) {
  return Run(Overrides().auto_block_reset, real::AutoBlockReset, ip);
}

int VELKWinsUserNameFqdn2Netbios(const char *name, char *out, size_t capacity) {
  return Run(Overrides().fqdn_to_netbios, real::FqdnToNetbios, name, out, capacity);
}

int VelkCgiInit(VelkCgi **cgi, const char *reserved) {
  return Run(Overrides().cgi_init, real::CgiInit, cgi, reserved);
}

int VelkCgiLoadInCookies(VelkCgi *cgi) {
  return Run(Overrides().cgi_load_in_cookies, real::CgiLoadInCookies, cgi);
}

const char *VelkCgiGetRequestParam(VelkCgi *cgi, const char *name, const char *fallback) {
  return Run(Overrides().cgi_param, real::CgiParam, cgi, name, fallback);
}

int VelkCgiSetCookies(VelkCgi *cgi, const char *name, const char *value, long expires,
                      const char *path, const char *domain, int secure) {
  return Run(Overrides().cgi_set_cookies, real::CgiSetCookies, cgi, name, value, expires, path,
             domain, secure);
}

int VelkCgiLogin(VelkCgi *cgi, char *name_out, size_t capacity, VelkCgiLoginRecord *record) {
  return Run(Overrides().cgi_login, real::CgiLogin, cgi, name_out, capacity, record);
}

int VelkCgiGetRemoteIP(char *out, size_t capacity) {
  return Run(Overrides().cgi_remote_ip, real::CgiRemoteIp, out, capacity);
}

int VelkCgiIsDeniedIP(const char *ip) {
  return Run(Overrides().cgi_is_denied_ip, real::CgiIsDeniedIp, ip);
}

void VelkCgiFree(VelkCgi *cgi) {
  Run(Overrides().cgi_free, real::CgiFree, cgi);
}

__attribute__((visibility("default"))) time_t time(time_t *out) noexcept {
  const time_t now = Run(Overrides().clock, real::Clock);
  if (out != nullptr) *out = now;
  return now;
}

}  // extern "C"

bool VELK::RANDOM::VELKRandom::getString(const std::string &pool, unsigned int length,
                                         std::string &out) {
  return Run(Overrides().random_text, real::RandomText, pool, length, out);
}

int VELK::RANDOM::VELKRandomBase::random(int low, int high) {
  return Run(Overrides().random_number, real::RandomNumber, low, high);
}
