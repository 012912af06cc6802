// What the test probe reads about renders and sets for them, and the clock
// the render entry points keep.
#pragma once

#include <chrono>

namespace tarsel_ref {

// Wall time of the last render call, measured inside the entry point.
void note_render_seconds(double seconds);
double last_render_seconds();

// Notes the call's wall time however it ends, an abort included.
class RenderClock {
public:
  RenderClock() : start_(std::chrono::steady_clock::now()) {}
  ~RenderClock() {
    note_render_seconds(std::chrono::duration<double>(std::chrono::steady_clock::now() - start_).count());
  }
  RenderClock(const RenderClock &) = delete;
  RenderClock &operator=(const RenderClock &) = delete;

private:
  std::chrono::steady_clock::time_point start_;
};

// While set, the render entry points check their basic arguments and return
// success without rendering (for measuring what a call costs on its way in).
void set_render_immediate_return(bool on);
bool render_immediate_return();

}  // namespace tarsel_ref
