// The header that precedes each message in a shared-memory segment: a wire
// record shared with the peer process, read in place and never written from
// Python.

%include "stdint.i"

%{
#include "tarsel/ipc.h"
%}

// char HeaderText[ANY]
// A fixed text field: the bytes up to the first NUL, or the whole field when
// it holds none, decoded like every text result.
%typemap(out) char HeaderText[ANY] {
  $result = engine_text($1, strnlen($1, $1_dim0));
}

%apply char HeaderText[ANY] { char desc[24], char reserved[24] };

%immutable Tarsel::IPC::MessageHeader_t::id;
%immutable Tarsel::IPC::MessageHeader_t::size;
%immutable Tarsel::IPC::MessageHeader_t::desc;
%immutable Tarsel::IPC::MessageHeader_t::reserved;

namespace Tarsel {
namespace IPC {
struct MessageHeader_t {
  uint32_t id;
  size_t size;
  char desc[24];
  char reserved[24];
};
}
}
