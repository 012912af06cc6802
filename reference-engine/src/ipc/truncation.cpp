#include "ipc/truncation.h"

#include <signal.h>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdint>
#include <mutex>

namespace tarsel_ref {
namespace ipc {
namespace {

// Read by the signal handler: plain atomics, no lock.
struct GuardedMapping {
  std::atomic<uintptr_t> start{0};
  std::atomic<std::size_t> size{0};
  std::atomic<bool> truncated{false};
};
GuardedMapping guarded[kGuardedMappings];
const std::atomic<bool> never_truncated{false};

std::mutex install_mutex;  // guards the slots' claiming and the one installation
bool installed = false;
struct sigaction previous;

// The handler installed before this one gets what is not ours. SIG_DFL (and
// SIG_IGN, which cannot hold for a fault) means the default: for a fault,
// returning re-runs the access, which then ends the process as before; a
// SIGBUS sent by kill or raise is sent again.
void pass_on(int signal, siginfo_t *info, void *context) {
  if (previous.sa_flags & SA_SIGINFO) {
    previous.sa_sigaction(signal, info, context);
  } else if (previous.sa_handler != SIG_DFL && previous.sa_handler != SIG_IGN) {
    previous.sa_handler(signal);
  } else {
    struct sigaction standard = {};
    standard.sa_handler = SIG_DFL;
    sigaction(SIGBUS, &standard, nullptr);
    if (info->si_code <= 0) raise(SIGBUS);
  }
}

void on_bus_error(int signal, siginfo_t *info, void *context) {
  const uintptr_t address = reinterpret_cast<uintptr_t>(info->si_addr);
  if (info->si_code > 0) {  // a fault, not a signal sent by someone
    for (GuardedMapping &mapping : guarded) {
      const uintptr_t start = mapping.start.load(std::memory_order_acquire);
      const std::size_t size = mapping.size.load(std::memory_order_acquire);
      if (!start || address < start || address >= start + size) continue;
      const uintptr_t page = address & ~(static_cast<uintptr_t>(sysconf(_SC_PAGESIZE)) - 1);
      // The raw system call: no interposed mmap (a sanitizer's, say) runs in
      // a signal handler.
      const long placed = syscall(SYS_mmap, page, start + size - page, PROT_READ | PROT_WRITE,
                                  MAP_PRIVATE | MAP_ANONYMOUS | MAP_FIXED, -1, 0);
      if (placed == static_cast<long>(page)) {
        mapping.truncated.store(true, std::memory_order_release);
        return;
      }
    }
  }
  pass_on(signal, info, context);
}

void install() {
  struct sigaction action = {};
  action.sa_sigaction = on_bus_error;
  action.sa_flags = SA_SIGINFO | SA_ONSTACK;
  sigemptyset(&action.sa_mask);
  installed = sigaction(SIGBUS, &action, &previous) == 0;
}

}  // namespace

const std::atomic<bool> *guard_mapping(void *start, std::size_t size) {
  std::lock_guard<std::mutex> lock(install_mutex);
  if (!installed) install();
  for (GuardedMapping &mapping : guarded) {
    if (mapping.start.load(std::memory_order_relaxed)) continue;
    mapping.truncated.store(false, std::memory_order_relaxed);
    mapping.size.store(size, std::memory_order_release);
    mapping.start.store(reinterpret_cast<uintptr_t>(start), std::memory_order_release);
    return &mapping.truncated;
  }
  return &never_truncated;
}

void unguard_mapping(void *start) {
  std::lock_guard<std::mutex> lock(install_mutex);
  for (GuardedMapping &mapping : guarded) {
    if (mapping.start.load(std::memory_order_relaxed) != reinterpret_cast<uintptr_t>(start)) continue;
    mapping.start.store(0, std::memory_order_release);
    mapping.size.store(0, std::memory_order_release);
    return;
  }
}

}  // namespace ipc
}  // namespace tarsel_ref
