/* Native floors for the shared-memory transport benchmark
 * (benchmarks/shmem_transport.py compiles and runs this with gcc -O2).
 *
 *   pingpong condvar ROUNDS WARMUP   two processes (fork) pass a turn back
 *                                    and forth through a process-shared
 *                                    mutex and condition variable
 *   pingpong futex ROUNDS WARMUP     the same over a futex word, each wait
 *                                    first spinning up to 20 us (as the
 *                                    transport's waits do)
 *   pingpong memcpy SECONDS REGION SIZE...
 *                                    single-core memcpy bandwidth: a fixed
 *                                    source of SIZE bytes copied to 64-byte
 *                                    aligned places walking through a
 *                                    REGION-byte destination, as a writer
 *                                    fills a ring; REGION 0: always to the
 *                                    same place (a destination kept in cache)
 *
 * Output: "key value" lines; round trips in nanoseconds, bandwidth in MB/s
 * (10^6 bytes per second).
 */
#define _GNU_SOURCE
#include <limits.h>
#include <linux/futex.h>
#include <pthread.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

static inline void cpu_relax(void) {
#if defined(__x86_64__) || defined(__i386__)
  __builtin_ia32_pause();
#elif defined(__aarch64__)
  __asm__ __volatile__("yield");
#endif
}

static int64_t now_ns(void) {
  struct timespec ts;
  clock_gettime(CLOCK_MONOTONIC, &ts);
  return (int64_t)ts.tv_sec * 1000000000 + ts.tv_nsec;
}

static int compare_i64(const void *a, const void *b) {
  int64_t x = *(const int64_t *)a, y = *(const int64_t *)b;
  return x < y ? -1 : x > y;
}

struct Shared {
  pthread_mutex_t lock;
  pthread_cond_t changed;
  uint32_t turn;     /* 1: the child's move, 0: the parent's */
  uint32_t sleepers; /* futex mode: processes asleep on turn */
};

static struct Shared *shared_block(void) {
  void *bytes = mmap(NULL, sizeof(struct Shared), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
  if (bytes == MAP_FAILED) {
    perror("mmap");
    exit(1);
  }
  memset(bytes, 0, sizeof(struct Shared));
  return bytes;
}

/* Condition variable hand-over. */
static void cv_pass(struct Shared *s, uint32_t to) {
  pthread_mutex_lock(&s->lock);
  s->turn = to;
  pthread_cond_signal(&s->changed);
  pthread_mutex_unlock(&s->lock);
}

static void cv_await(struct Shared *s, uint32_t want) {
  pthread_mutex_lock(&s->lock);
  while (s->turn != want) pthread_cond_wait(&s->changed, &s->lock);
  pthread_mutex_unlock(&s->lock);
}

/* Futex hand-over: spin first, then sleep on the word. */
static void futex_pass(struct Shared *s, uint32_t to) {
  __atomic_store_n(&s->turn, to, __ATOMIC_SEQ_CST);
  if (__atomic_load_n(&s->sleepers, __ATOMIC_SEQ_CST)) syscall(SYS_futex, &s->turn, FUTEX_WAKE, INT_MAX, NULL, NULL, 0);
}

static void futex_await(struct Shared *s, uint32_t want) {
  const int64_t spin_end = now_ns() + 20000;
  for (unsigned round = 1;; ++round) {
    if (__atomic_load_n(&s->turn, __ATOMIC_ACQUIRE) == want) return;
    cpu_relax();
    if (round % 16 == 0 && now_ns() >= spin_end) break;
  }
  for (;;) {
    __atomic_fetch_add(&s->sleepers, 1u, __ATOMIC_SEQ_CST);
    uint32_t seen = __atomic_load_n(&s->turn, __ATOMIC_SEQ_CST);
    if (seen != want) syscall(SYS_futex, &s->turn, FUTEX_WAIT, seen, NULL, NULL, 0);
    __atomic_fetch_sub(&s->sleepers, 1u, __ATOMIC_SEQ_CST);
    if (__atomic_load_n(&s->turn, __ATOMIC_ACQUIRE) == want) return;
  }
}

static int pingpong(int use_futex, long rounds, long warmup) {
  struct Shared *s = shared_block();
  pthread_mutexattr_t mattr;
  pthread_condattr_t cattr;
  pthread_mutexattr_init(&mattr);
  pthread_mutexattr_setpshared(&mattr, PTHREAD_PROCESS_SHARED);
  pthread_condattr_init(&cattr);
  pthread_condattr_setpshared(&cattr, PTHREAD_PROCESS_SHARED);
  pthread_mutex_init(&s->lock, &mattr);
  pthread_cond_init(&s->changed, &cattr);
  void (*pass)(struct Shared *, uint32_t) = use_futex ? futex_pass : cv_pass;
  void (*await_turn)(struct Shared *, uint32_t) = use_futex ? futex_await : cv_await;

  const long total = rounds + warmup;
  pid_t child = fork();
  if (child < 0) {
    perror("fork");
    return 1;
  }
  if (child == 0) {
    for (long i = 0; i < total; ++i) {
      await_turn(s, 1);
      pass(s, 0);
    }
    _exit(0);
  }
  int64_t *times = malloc(sizeof(int64_t) * (size_t)rounds);
  for (long i = 0; i < total; ++i) {
    const int64_t start = now_ns();
    pass(s, 1);
    await_turn(s, 0);
    if (i >= warmup) times[i - warmup] = now_ns() - start;
  }
  waitpid(child, NULL, 0);
  qsort(times, (size_t)rounds, sizeof(int64_t), compare_i64);
  printf("rounds %ld\n", rounds);
  printf("median_ns %lld\n", (long long)times[rounds / 2]);
  printf("p99_ns %lld\n", (long long)times[(long)(rounds * 0.99)]);
  printf("min_ns %lld\n", (long long)times[0]);
  free(times);
  return 0;
}

static int bandwidth(double seconds, size_t region_bytes, int count, char **sizes) {
  for (int k = 0; k < count; ++k) {
    const size_t size = strtoull(sizes[k], NULL, 10);
    const size_t step = (size + 63) & ~(size_t)63;
    const size_t region = region_bytes ? region_bytes : step;
    if (step > region) continue;
    unsigned char *dest = mmap(NULL, region, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (dest == MAP_FAILED) {
      perror("mmap");
      return 1;
    }
    memset(dest, 1, region); /* every page present before timing */
    unsigned char *source = aligned_alloc(64, step);
    memset(source, 7, step);
    size_t offset = 0;
    /* One pass through the region untimed, then copies for `seconds`. */
    for (size_t done = 0; done < region; done += step) {
      if (offset + step > region) offset = 0;
      memcpy(dest + offset, source, size);
      offset += step;
    }
    long copies = 0;
    const int64_t start = now_ns();
    const int64_t end = start + (int64_t)(seconds * 1e9);
    int64_t stop;
    for (;;) {
      for (int i = 0; i < 64; ++i) {
        if (offset + step > region) offset = 0;
        memcpy(dest + offset, source, size);
        __asm__ __volatile__("" : : "r"(dest + offset) : "memory");
        offset += step;
      }
      copies += 64;
      if ((stop = now_ns()) >= end) break;
    }
    printf("memcpy_%zu %.1f\n", size, (double)copies * (double)size / ((double)(stop - start) / 1e9) / 1e6);
    free(source);
    munmap(dest, region);
  }
  return 0;
}

int main(int argc, char **argv) {
  if (argc >= 4 && strcmp(argv[1], "condvar") == 0) return pingpong(0, atol(argv[2]), atol(argv[3]));
  if (argc >= 4 && strcmp(argv[1], "futex") == 0) return pingpong(1, atol(argv[2]), atol(argv[3]));
  if (argc >= 5 && strcmp(argv[1], "memcpy") == 0)
    return bandwidth(atof(argv[2]), strtoull(argv[3], NULL, 10), argc - 4, argv + 4);
  fprintf(stderr, "usage: pingpong condvar|futex ROUNDS WARMUP | memcpy SECONDS REGION SIZE...\n");
  return 2;
}
