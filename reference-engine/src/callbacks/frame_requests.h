// Frame requests: frames of an input other than the one a render call hands
// over, asked of the host during the render through the callback installed
// with set_load_other_frame_into_buffer_fun.
//
// Requests are made on a thread of the render's own (never the thread that
// called the render, which waits meanwhile), one at a time. Each answer is
// read into the render's working form before the request returns, so the
// host's buffer needs to stay valid only until then. A callback that throws
// ends the render as an abort, without setting the abort request.
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <string>

#include "rendering/render_call.h"
#include "tarsel/genotype.h"
#include "tarsel/load_frame.h"

namespace tarsel_ref {

// Installs the host's callback (null: none).
void install_frame_request(T_LoadOtherFrameFun fun);

// The installed callback; null when there is none.
T_LoadOtherFrameFun installed_frame_request();

// The frame requests of one render.
class FrameRequests : public OtherFrames {
public:
  using Reader = FrameReader;

  // `state` is what the callback receives as the render state; `instance`
  // and `genotype` are the two engine values.
  FrameRequests(T_LoadOtherFrameFun fun, const T_RenderState &state, void *instance, const Genotype &genotype,
                Reader read);
  ~FrameRequests();

  FrameRequests(const FrameRequests &) = delete;
  FrameRequests &operator=(const FrameRequests &) = delete;

  std::shared_ptr<const WorkImage> request(int input, int frame, unsigned char flag) override;

private:
  class Thread;

  std::string describe_request(int input, int frame) const;

  T_LoadOtherFrameFun fun_;
  T_RenderState state_;
  void *instance_;
  const Genotype &genotype_;
  Reader read_;
  std::mutex one_at_a_time_;
  bool failed_ = false;  // guarded by one_at_a_time_
  std::unique_ptr<Thread> thread_;
};

// The frame requests of one render through the installed callback; null
// when none is installed. What a render call is given to ask the host for
// frames (RenderCall::other_frames).
std::unique_ptr<OtherFrames> host_frame_requests(const T_RenderState &state, void *instance, const Genotype &genotype,
                                                 FrameReader read);

}  // namespace tarsel_ref
