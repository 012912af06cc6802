// Factory of the external-monitor library.
#include <new>

#include "monitor/display.h"
#include "monitor/live_objects.h"

EM_Display *EM_DisplayInit() {
  if (qrv_ref::init_fails()) return nullptr;
  try {
    return new qrv_ref::ReferenceDisplay;
  } catch (const std::bad_alloc &) {
    return nullptr;  // the contract's answer when no display can be made
  }
}
