#include "rendering/workers.h"

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <deque>
#include <exception>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "core/abort.h"
#include "core/thread_end.h"

namespace tarsel_ref {
namespace {

struct Job {
  const std::function<void(int)> *task = nullptr;
  int n_tasks = 0;
  int max_helpers = 0;
  int helpers = 0;  // guarded by the pool's mutex
  std::atomic<int> next{0};
  std::atomic<bool> failed{false};
  std::mutex error_mutex;
  std::exception_ptr error;

  bool wants_help() const { return helpers < max_helpers && next.load(std::memory_order_relaxed) < n_tasks; }

  void work() {
    for (;;) {
      const int i = next.fetch_add(1, std::memory_order_relaxed);
      if (i >= n_tasks) return;
      if (failed.load(std::memory_order_relaxed)) continue;
      try {
        (*task)(i);
      }
      TARSEL_LET_THREAD_END catch (...) {
        std::lock_guard<std::mutex> lock(error_mutex);
        if (!error) error = std::current_exception();
        failed.store(true);
      }
    }
  }
};

class Pool {
public:
  explicit Pool(int size) {
    threads_.reserve(static_cast<std::size_t>(size));
    try {
      for (int i = 0; i < size; ++i) threads_.emplace_back([this] { serve(); });
    } catch (...) {
      stop();  // the threads already started must not outlive a pool that was never made
      throw;
    }
  }

  ~Pool() { stop(); }

  Pool(const Pool &) = delete;
  Pool &operator=(const Pool &) = delete;

  int size() const { return static_cast<int>(threads_.size()); }

  void run(Job &job) {
    if (job.max_helpers > 0) {
      {
        std::lock_guard<std::mutex> lock(mutex_);
        queue_.push_back(&job);
      }
      if (job.max_helpers == 1)
        work_cv_.notify_one();
      else
        work_cv_.notify_all();
    }
    job.work();
    if (job.max_helpers > 0) {
      // No helper may still be inside the job when it goes out of scope.
      std::unique_lock<std::mutex> lock(mutex_);
      queue_.erase(std::find(queue_.begin(), queue_.end(), &job));
      left_cv_.wait(lock, [&] { return job.helpers == 0; });
    }
  }

private:
  void stop() {
    {
      std::lock_guard<std::mutex> lock(mutex_);
      stopping_ = true;
    }
    work_cv_.notify_all();
    for (std::thread &t : threads_) t.join();
  }

  void serve() {
    std::unique_lock<std::mutex> lock(mutex_);
    for (;;) {
      Job *job = nullptr;
      work_cv_.wait(lock, [&] { return stopping_ || (job = joinable()) != nullptr; });
      if (!job) return;
      ++job->helpers;
      lock.unlock();
      job->work();
      lock.lock();
      --job->helpers;
      left_cv_.notify_all();
    }
  }

  Job *joinable() const {
    for (Job *job : queue_)
      if (job->wants_help()) return job;
    return nullptr;
  }

  std::mutex mutex_;
  std::condition_variable work_cv_;
  std::condition_variable left_cv_;
  std::deque<Job *> queue_;
  bool stopping_ = false;
  std::vector<std::thread> threads_;
};

int core_count() {
  const unsigned cores = std::thread::hardware_concurrency();
  return cores == 0 ? 1 : static_cast<int>(std::min(cores, 256u));
}

struct PoolHolder {
  std::mutex mutex;
  std::shared_ptr<Pool> pool;
};

PoolHolder &holder() {
  // Never destroyed: at process exit a render may still hold pool threads
  // (one waiting on a host that is gone), and joining them would never end.
  static PoolHolder *instance = new PoolHolder;
  return *instance;
}

std::shared_ptr<Pool> acquire_pool() {
  PoolHolder &h = holder();
  std::lock_guard<std::mutex> lock(h.mutex);
  if (!h.pool) h.pool = std::make_shared<Pool>(core_count());
  return h.pool;
}

}  // namespace

void run_tasks(int n_tasks, int n_threads, const std::function<void(int)> &task) {
  if (n_tasks <= 0) return;
  Job job;
  job.task = &task;
  job.n_tasks = n_tasks;
  const int wanted = n_threads <= 0 ? core_count() : n_threads;
  const int participants = std::min(wanted, n_tasks);
  std::shared_ptr<Pool> pool;
  if (participants > 1) {
    pool = acquire_pool();
    job.max_helpers = std::min(participants - 1, pool->size());
    pool->run(job);
  } else {
    job.work();
  }
  if (job.error) std::rethrow_exception(job.error);
}

void run_rows(int n_rows, int n_threads, const std::function<void(int)> &row) {
  if (n_rows <= 0) return;
  // Bands small enough to share the lines out evenly, large enough that
  // handing them out costs nothing next to the work.
  const int band = std::clamp(n_rows / 64, 1, 16);
  const int n_bands = (n_rows + band - 1) / band;
  run_tasks(n_bands, n_threads, [&](int b) {
    const int end = std::min(n_rows, (b + 1) * band);
    for (int y = b * band; y < end; ++y) {
      throw_if_aborted();
      row(y);
    }
  });
}

int worker_thread_count() {
  PoolHolder &h = holder();
  std::lock_guard<std::mutex> lock(h.mutex);
  return h.pool ? h.pool->size() : 0;
}

void release_workers() {
  std::shared_ptr<Pool> released;
  {
    PoolHolder &h = holder();
    std::lock_guard<std::mutex> lock(h.mutex);
    released.swap(h.pool);
  }
}

}  // namespace tarsel_ref
