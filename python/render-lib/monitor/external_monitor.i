// Status codes and image formats of the external-monitor library.

%{
#include "qrv/external_monitor.h"
%}

enum EM_error {
  EM_errorNone = 0,
  EM_errorParam = 1,
  EM_errorNotFound = 2,
  EM_errorAllocate = 3,
  EM_errorLast = 4,
  EM_errorDevice = 2000
};

// 32-bit integer pixels with byte orders B, G, R, A and A, R, G, B.
enum EM_ImageFormat {
  EM_ImageFormat_32BitIntBGRA = 0,
  EM_ImageFormat_32BitIntARGB = 1
};
