// A thread that the C library ends (pthread_exit or cancellation: a host
// interpreter, for one, ends a foreign thread that asks for its lock while it
// shuts down) leaves by unwinding with a special exception. Swallowing that
// exception aborts the whole process, so every catch-all on a path that may
// call host code lets it through first:
//
//   try { ... } TARSEL_LET_THREAD_END catch (...) { ... }
#pragma once

#if defined(__GLIBCXX__)
#  include <cxxabi.h>
#  define TARSEL_LET_THREAD_END      \
    catch (abi::__forced_unwind &) { \
      throw;                         \
    }
#else
#  define TARSEL_LET_THREAD_END
#endif
