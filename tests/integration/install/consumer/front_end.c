/* A front end that serves one login after another. Each line of standard input asks for one: HASH,
   or HASH ACCOUNT PASSWORD. The answer is the result, the session and the process's effective
   user and group. */
#include <stdio.h>
#include <unistd.h>
#include <velksharing/access.h>

int main(void) {
  char line[256], hash[64], account[64], password[64];
  while (fgets(line, sizeof line, stdin) != NULL) {
    const int words = sscanf(line, "%63s %63s %63s", hash, account, password);
    const struct _tag_sharing_login_params params = {hash, NULL, words > 1 ? account : NULL,
                                                     words > 2 ? password : NULL, NULL};
    char session_id[33] = "";
    const int result = VelkSharingLogin(session_id, sizeof session_id, &params, 1);
    printf("%d '%s' %u:%u\n", result, session_id, (unsigned)geteuid(), (unsigned)getegid());
    fflush(stdout);
  }
  return 0;
}
