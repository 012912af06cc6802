// What the module runs against: the engine's version and build identifier,
// the module's own identifier, the engine's colour-management configuration,
// and the identity of the process's user.
%{
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include "build_id.h"
#include "tarsel/identity.h"
#ifdef _WIN32
#include <windows.h>
#include <sddl.h>
#else
#include <unistd.h>
#endif

static std::string tarsel_version_text()
{
  char buffer[256] = "";
  get_tarsel_version_info(buffer, 255);
  return buffer;
}

static const char *ext_build_id()
{
  return RENDERLIB_BUILD_ID;
}

static bool check_build_id()
{
  const char *engine_id = get_tarsel_build_id();
  return engine_id && std::strcmp(engine_id, RENDERLIB_BUILD_ID) == 0;
}

// The current user's identity text: on Windows the security identifier of the
// process token's user ("S-1-5-21-..."); elsewhere the effective user id in the
// security-identifier form used for POSIX users, "S-1-22-1-<uid>". Returns
// false when the identity cannot be read.
static bool current_user_identity(char (&text)[512])
{
#ifdef _WIN32
  HANDLE token = NULL;
  if (!OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, &token))
    return false;
  bool found = false;
  DWORD size = 0;
  if (!GetTokenInformation(token, TokenUser, NULL, 0, &size) && GetLastError() == ERROR_INSUFFICIENT_BUFFER) {
    TOKEN_USER *user = static_cast<TOKEN_USER *>(std::malloc(size));
    LPSTR sid_text = NULL;
    if (user && GetTokenInformation(token, TokenUser, user, size, &size) &&
        ConvertSidToStringSidA(user->User.Sid, &sid_text)) {
      std::snprintf(text, sizeof text, "%s", sid_text);
      LocalFree(sid_text);
      found = true;
    }
    std::free(user);
  }
  CloseHandle(token);
  return found;
#else
  std::snprintf(text, sizeof text, "S-1-22-1-%lu", static_cast<unsigned long>(geteuid()));
  return true;
#endif
}

static bool check_user(const char *identity)
{
  char text[512];
  return identity && current_user_identity(text) && std::strcmp(text, identity) == 0;
}
%}

%rename(get_tarsel_version_info) tarsel_version_text;
std::string tarsel_version_text();
const char *ext_build_id();
const char *get_tarsel_build_id();
bool check_build_id();
namespace Tarsel {
std::string get_ocio_path();
}
bool check_user(const char *identity);
