// Factory of the external-monitor library. No monitor devices are implemented
// yet: no display object can be made, which the contract reports as null.
#include "qrv/external_monitor.h"

EM_Display *EM_DisplayInit() { return nullptr; }
