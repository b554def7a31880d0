#ifndef TESTS_FAULT_PLATFORM_OVERRIDE_H
#define TESTS_FAULT_PLATFORM_OVERRIDE_H

#include <velk/velkcgi.h>
#include <velk/velkcore.h>
#include <velk/velkdb.h>
#include <velk/velkrandom.h>
#include <velk/velksdk.h>
#include <velk/velkwins.h>

#include <ctime>
#include <functional>
#include <string>

/// A platform that fails on demand.
///
/// A program that contains platform_override.cpp takes the place of single platform functions for
/// every library that it loads. Each runs what a test has put in its place, else the real one:
///
///     const OverrideScope scope;
///     Overrides().file_touch = [](const char *) { return -1; };

namespace velk_test {

/// What runs in place of the platform's functions; empty: the real one.
struct PlatformOverrides {
  std::function<VELKDBHandle *(const char *host, const char *user, const char *password,
                               const char *path)>
      db_connect;
  std::function<int(VELKDBHandle *handle, const char *sql, DBResult **result)> db_execute;
  std::function<int(int engine, char *out, size_t capacity, const char *in, size_t length)>
      db_escape;
  std::function<void(VELKDBHandle *handle)> db_close;

  std::function<int(const char *path)> file_exist;
  std::function<int(const char *path)> file_touch;
  std::function<int(const char *path, int reserved, unsigned int mode)> acl_chmod;

  std::function<int(const char *name, VELKUSER **user)> user_get;
  std::function<int(unsigned int uid, VELKUSER **user)> user_get_by_uid;
  std::function<void(VELKUSER *user)> user_free;
  std::function<int(const char *name, char *out, size_t capacity)> login_name_convert;
  std::function<int(const char *name, char *out, size_t capacity)> real_name_get;
  std::function<int(const char *name, unsigned int *gid)> group_get_gid;
  std::function<int(unsigned int gid, VELKGROUP **group)> group_get_by_gid;
  std::function<void(VELKGROUP *group)> group_free;
  std::function<VLIBCSzHash *(const char *user, int arg1, int arg2)> group_info;
  std::function<const char *(const VLIBCSzHash *list, size_t index, int *end)> list_name;
  std::function<void(VLIBCSzHash *list)> list_free;
  std::function<int(const char *ip, const char *category)> auto_block_fail;
  std::function<int(const char *ip)> auto_block_reset;
  std::function<int(const char *name, char *out, size_t capacity)> fqdn_to_netbios;

  std::function<int(VelkCgi **cgi, const char *reserved)> cgi_init;
  std::function<int(VelkCgi *cgi)> cgi_load_in_cookies;
  std::function<const char *(VelkCgi *cgi, const char *name, const char *fallback)> cgi_param;
  std::function<int(VelkCgi *cgi, const char *name, const char *value, long expires,
                    const char *path, const char *domain, int secure)>
      cgi_set_cookies;
  std::function<int(VelkCgi *cgi, char *name_out, size_t capacity, VelkCgiLoginRecord *record)>
      cgi_login;
  std::function<int(char *out, size_t capacity)> cgi_remote_ip;
  std::function<int(const char *ip)> cgi_is_denied_ip;
  std::function<void(VelkCgi *cgi)> cgi_free;

  std::function<bool(const std::string &pool, unsigned int length, std::string &out)> random_text;
  std::function<int(int low, int high)> random_number;

  std::function<time_t()> clock;
};

/// The overrides in force in this process.
PlatformOverrides &Overrides();

/// No overrides at its start and at its end.
class OverrideScope {
 public:
  OverrideScope() { Overrides() = {}; }
  OverrideScope(const OverrideScope &) = delete;
  OverrideScope &operator=(const OverrideScope &) = delete;
  ~OverrideScope() { Overrides() = {}; }
};

/// The real functions, for overrides that only watch or fail now and then.
namespace real {
VELKDBHandle *DbConnect(const char *host, const char *user, const char *password, const char *path);
int DbExecute(VELKDBHandle *handle, const char *sql, DBResult **result);
int DbEscape(int engine, char *out, size_t capacity, const char *in, size_t length);
void DbClose(VELKDBHandle *handle);
int FileExist(const char *path);
int FileTouch(const char *path);
int AclChmod(const char *path, int reserved, unsigned int mode);
int UserGet(const char *name, VELKUSER **user);
int UserGetByUid(unsigned int uid, VELKUSER **user);
void UserFree(VELKUSER *user);
int LoginNameConvert(const char *name, char *out, size_t capacity);
int RealNameGet(const char *name, char *out, size_t capacity);
int GroupGetGid(const char *name, unsigned int *gid);
int GroupGetByGid(unsigned int gid, VELKGROUP **group);
void GroupFree(VELKGROUP *group);
VLIBCSzHash *GroupInfo(const char *user, int arg1, int arg2);
const char *ListName(const VLIBCSzHash *list, size_t index, int *end);
void ListFree(VLIBCSzHash *list);
int AutoBlockFail(const char *ip, const char *category);
int AutoBlockReset(const char *ip);
int FqdnToNetbios(const char *name, char *out, size_t capacity);
int CgiInit(VelkCgi **cgi, const char *reserved);
int CgiLoadInCookies(VelkCgi *cgi);
const char *CgiParam(VelkCgi *cgi, const char *name, const char *fallback);
int CgiSetCookies(VelkCgi *cgi, const char *name, const char *value, long expires, const char *path,
                  const char *domain, int secure);
int CgiLogin(VelkCgi *cgi, char *name_out, size_t capacity, VelkCgiLoginRecord *record);
int CgiRemoteIp(char *out, size_t capacity);
int CgiIsDeniedIp(const char *ip);
void CgiFree(VelkCgi *cgi);
bool RandomText(const std::string &pool, unsigned int length, std::string &out);
int RandomNumber(int low, int high);
time_t Clock();
}  // namespace real

}  // namespace velk_test

#endif
