#include "callbacks/frame_requests.h"

#include <atomic>
#include <condition_variable>
#include <cstring>
#include <stdexcept>
#include <thread>

#include "core/abort.h"
#include "core/thread_end.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

std::atomic<T_LoadOtherFrameFun> installed{nullptr};

}  // namespace

void install_frame_request(T_LoadOtherFrameFun fun) { installed.store(fun); }

T_LoadOtherFrameFun installed_frame_request() { return installed.load(); }

// The render's request thread, started by its first request: runs one piece
// of work at a time while the requesting thread waits for it.
class FrameRequests::Thread {
public:
  ~Thread() {
    {
      std::lock_guard<std::mutex> lock(mutex_);
      stopping_ = true;
    }
    changed_.notify_all();
    if (thread_.joinable()) thread_.join();
  }

  // Runs `work`, which must not throw, on the thread and returns when it is done.
  void run(const std::function<void()> &work) {
    std::unique_lock<std::mutex> lock(mutex_);
    if (!thread_.joinable()) thread_ = std::thread([this] { serve(); });
    work_ = &work;
    changed_.notify_all();
    changed_.wait(lock, [&] { return work_ == nullptr; });
  }

private:
  void serve() {
    std::unique_lock<std::mutex> lock(mutex_);
    for (;;) {
      changed_.wait(lock, [&] { return stopping_ || work_ != nullptr; });
      if (!work_) return;
      const std::function<void()> *work = work_;
      lock.unlock();
      (*work)();
      lock.lock();
      work_ = nullptr;
      changed_.notify_all();
    }
  }

  std::mutex mutex_;
  std::condition_variable changed_;
  const std::function<void()> *work_ = nullptr;
  bool stopping_ = false;
  std::thread thread_;
};

FrameRequests::FrameRequests(T_LoadOtherFrameFun fun, const T_RenderState &state, void *instance,
                             const Genotype &genotype, Reader read)
    : fun_(fun), state_(state), instance_(instance), genotype_(genotype), read_(std::move(read)),
      thread_(std::make_unique<Thread>()) {}

FrameRequests::~FrameRequests() = default;

std::string FrameRequests::describe_request(int input, int frame) const {
  std::string text = "frame " + std::to_string(frame) + " of input " + std::to_string(input);
  if (input >= 0 && input < MAX_INPUTS) {
    const char *name = genotype_.input_names[input];
    text += " (\"" + std::string(name, strnlen(name, MAX_INPUT_NAME_LEN)) + "\")";
  }
  return text;
}

std::shared_ptr<const WorkImage> FrameRequests::request(int input, int frame, unsigned char flag) {
  std::lock_guard<std::mutex> lock(one_at_a_time_);
  if (failed_) throw TarselAbortException();
  throw_if_aborted();
  T_RasterInfo info;
  std::memset(&info, 0, sizeof info);
  void *pixels = nullptr;
  bool threw = false;
  // Whatever the host throws stays on the request thread: its type means
  // nothing to the engine or to the host's caller.
  const std::function<void()> work = [&] {
    try {
      pixels = fun_(&state_, input, frame, flag, instance_, const_cast<Genotype *>(&genotype_), &info);
    }
    TARSEL_LET_THREAD_END catch (...) { threw = true; }
  };
  thread_->run(work);
  if (threw) {
    failed_ = true;
    throw TarselAbortException();
  }
  if (!pixels) return nullptr;
  std::string error;
  std::shared_ptr<const WorkImage> image = read_(info, pixels, &error);
  if (!image) throw std::runtime_error("the host's answer for " + describe_request(input, frame) + ": " + error);
  return image;
}

std::unique_ptr<OtherFrames> host_frame_requests(const T_RenderState &state, void *instance, const Genotype &genotype,
                                                 FrameReader read) {
  const T_LoadOtherFrameFun fun = installed_frame_request();
  if (!fun) return nullptr;
  return std::make_unique<FrameRequests>(fun, state, instance, genotype, std::move(read));
}

}  // namespace tarsel_ref
