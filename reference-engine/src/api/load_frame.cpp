// load_frame.h: the host's callback for frames a render asks for.
#include "callbacks/frame_requests.h"
#include "core/entry.h"
#include "tarsel/load_frame.h"

void set_load_other_frame_into_buffer_fun(T_LoadOtherFrameFun fun) {
  auto scope = tarsel_ref::enter("set_load_other_frame_into_buffer_fun", reinterpret_cast<const void *>(fun));
  tarsel_ref::install_frame_request(fun);
}
