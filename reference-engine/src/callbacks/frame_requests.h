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

#include "rendering/image.h"
#include "tarsel/genotype.h"
#include "tarsel/load_frame.h"

namespace tarsel_ref {

// The request flag: why a frame is wanted.
constexpr unsigned char kRequestOtherFrame = 0;      // another frame of an input
constexpr unsigned char kRequestPreviousOutput = 1;  // a frame of an input the previous output is rebuilt from

// The installed callback; null when there is none.
T_LoadOtherFrameFun installed_frame_request();

// The frame requests of one render.
class FrameRequests {
public:
  // Reads the pixels a request returned into the render's working form, as
  // the render reads its inputs; null with `error` set when the descriptor
  // does not describe pixels the render can read.
  using Reader =
      std::function<std::shared_ptr<const WorkImage>(const T_RasterInfo &info, void *pixels, std::string *error)>;

  // `state` is what the callback receives as the render state; `instance`
  // and `genotype` are the two engine values.
  FrameRequests(T_LoadOtherFrameFun fun, const T_RenderState &state, void *instance, const Genotype &genotype,
                Reader read);
  ~FrameRequests();

  FrameRequests(const FrameRequests &) = delete;
  FrameRequests &operator=(const FrameRequests &) = delete;

  // Frame `frame` of input `input` (counted from 0) as the host returns it,
  // in working form; null when the host has no such frame. Throws
  // TarselAbortException when the callback threw (this request or an earlier
  // one: none is made after a failure) or an abort is requested, and
  // std::runtime_error when the answer's descriptor does not read.
  std::shared_ptr<const WorkImage> request(int input, int frame, unsigned char flag);

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

}  // namespace tarsel_ref
