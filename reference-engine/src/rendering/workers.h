// The engine's worker threads: one process-wide pool, made on first use with
// one thread per core, shared by every render running at the time and let go
// of by tarsel_shutdown_apps (the next render makes it again).
//
// Work is split into tasks that each produce their own part of a result, so a
// result never depends on how many threads ran or which ran what. The calling
// thread works too. Nothing thrown by a task leaves the thread it ran on: the
// first exception is carried back and thrown on the calling thread once every
// thread has stopped working on the call.
#pragma once

#include <functional>

namespace tarsel_ref {

// Runs task(0) .. task(n_tasks - 1), each once, on at most `n_threads` threads
// (0: as many as the machine has cores) counting the calling thread. Tasks not
// yet begun are skipped once one has thrown.
void run_tasks(int n_tasks, int n_threads, const std::function<void(int)> &task);

// Runs row(0) .. row(n_rows - 1) like run_tasks, in bands of lines, checking
// the abort request before every line: an abort ends the call with
// TarselAbortException within one line's work.
void run_rows(int n_rows, int n_threads, const std::function<void(int)> &row);

// Threads of the pool; 0 while there is none.
int worker_thread_count();

// Lets go of the pool; its threads end once the calls using them return.
void release_workers();

}  // namespace tarsel_ref
