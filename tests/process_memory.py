"""This process's resident memory, for tests that check it stays flat."""

import os

# AddressSanitizer's quarantine keeps freed memory resident by design, so
# resident-memory checks mean nothing under it.
UNDER_ADDRESS_SANITIZER = "libasan" in os.environ.get("LD_PRELOAD", "")


def resident_kib():
    with open("/proc/self/status") as status:
        return next(int(line.split()[1]) for line in status if line.startswith("VmRSS:"))
