/* A libwbclient for tests: a machine whose winbind knows some domains. */

#include <stdbool.h>
#include <stdint.h>
#include <stdlib.h>
#include <string.h>
#include <sys/types.h>
#include <time.h>
#include <wbclient.h>

#define EXPORTED __attribute__((visibility("default")))

/* Domain descriptions handed out and not given back. */
EXPORTED int FakeWbclientHeld = 0;

static char short_name[] = "CORP";
static char empty_name[] = "";

static wbcErr Give(char *name, struct wbcDomainInfo **info) {
  *info = calloc(1, sizeof(**info));
  if (*info == NULL) return WBC_ERR_NO_MEMORY;
  (*info)->short_name = name;
  ++FakeWbclientHeld;
  return WBC_ERR_SUCCESS;
}

/* Takes the first 255 bytes of a name for the whole, like the real one. */
static bool Names255Bytes(const char *domain) {
  return strspn(domain, "r") >= 255;
}

EXPORTED wbcErr wbcDomainInfo(const char *domain, struct wbcDomainInfo **info) {
  if (strcmp(domain, "corp.example.com") == 0) return Give(short_name, info);
  if (Names255Bytes(domain)) return Give(short_name, info);
  if (strcmp(domain, "null.example.com") == 0) return Give(NULL, info);
  if (strcmp(domain, "empty.example.com") == 0) return Give(empty_name, info);
  if (strcmp(domain, "nothing.example.com") == 0) return WBC_ERR_SUCCESS;
  return WBC_ERR_DOMAIN_NOT_FOUND;
}

EXPORTED void wbcFreeMemory(void *memory) {
  if (memory == NULL) return;
  free(memory);
  --FakeWbclientHeld;
}
