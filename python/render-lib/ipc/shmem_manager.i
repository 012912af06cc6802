// Serving, connecting and resetting named shared-memory segments. The
// transports it makes belong to the Python proxy that receives them.

namespace Tarsel {
namespace IPC {

%newobject ShmemManager::serve;
%newobject ShmemManager::connect;

class ShmemManager {
public:
  static ShmemTransport *serve(const char *const name, size_t size1, size_t size2);
  static ShmemTransport *connect(const char *const name);
  static void reset(const char *const name, bool flag = false);
  static void reset_all(bool flag = false);
  ShmemManager();
  ~ShmemManager();
};

}
}
