// A visit whose calls are marked in a trace of the system calls: closing descriptor 1001 starts
// the login, 1002 the check, and 1003 ends it. Nothing has those descriptors open.
//
// usage: flushes_program HASH

#include <unistd.h>
#include <velksharing/access.h>

int main(int argc, char **argv) {
  if (argc != 2) return 2;
  _tag_sharing_login_params params = {argv[1], nullptr, nullptr, nullptr, nullptr};
  char session_id[33] = "";

  // Opens the database, and flushes the head of its new log.
  if (VelkSharingIncreaseUseCount(argv[1]) != 1) return 3;
  close(1001);
  if (VelkSharingLogin(session_id, sizeof session_id, &params, 0) != VELK_SHARING_LOGIN_OK)
    return 4;
  params.session_id = session_id;
  close(1002);
  if (VelkSharingIsAuthorized(&params) != VELK_SHARING_AUTH_OK) return 5;
  close(1003);
}
