#include "px_parallel.h"

#include <pthread.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <cstring>

namespace {
constexpr int kMaxBands = 8;

bool scalar_from_env() {
  const char* v = std::getenv("GLIMMER_SCALAR");
  return v && std::strcmp(v, "0") != 0 && *v;
}

std::atomic<bool> g_scalar{scalar_from_env()};

// GLIMMER_THREADS=n at load time caps the bands at n (0 or unset: one per core).
int threads_from_env() {
  const char* v = std::getenv("GLIMMER_THREADS");
  return v ? std::atoi(v) : 0;
}

std::atomic<int> g_threads{threads_from_env()};

int cpu_count() {
  long n = sysconf(_SC_NPROCESSORS_ONLN);
  const int cap = g_threads.load(std::memory_order_relaxed);
  if (cap > 0 && cap < n) n = cap;
  if (n < 1) return 1;
  return n > kMaxBands ? kMaxBands : static_cast<int>(n);
}

struct Band {
  px_band_fn fn;
  void* context;
  int y0, y1;
};

void* run_band(void* arg) {
  auto* b = static_cast<Band*>(arg);
  b->fn(b->context, b->y0, b->y1);
  return nullptr;
}
}  // namespace

bool px_scalar_only() { return g_scalar.load(std::memory_order_relaxed); }
void px_set_scalar_only(bool on) { g_scalar.store(on); }
void px_set_thread_count(int threads) { g_threads.store(threads < 0 ? 0 : threads); }
int px_thread_count() { return cpu_count(); }

int px_band_count(int rows, int min_rows_per_band) {
  if (px_scalar_only() || rows <= 0) return 1;
  if (min_rows_per_band < 1) min_rows_per_band = 1;
  int bands = cpu_count();
  int by_size = rows / min_rows_per_band;
  if (by_size < bands) bands = by_size;
  return bands < 1 ? 1 : bands;
}

void px_run_bands(int rows, int min_rows_per_band, px_band_fn fn, void* context) {
  if (rows <= 0) return;
  int bands = px_band_count(rows, min_rows_per_band);
  if (bands == 1) {
    fn(context, 0, rows);
    return;
  }
  Band band[kMaxBands];
  pthread_t thread[kMaxBands];
  bool started[kMaxBands] = {};
  for (int i = 0; i < bands; ++i) {
    band[i] = {fn, context, static_cast<int>(static_cast<long long>(rows) * i / bands),
               static_cast<int>(static_cast<long long>(rows) * (i + 1) / bands)};
  }
  for (int i = 1; i < bands; ++i) started[i] = pthread_create(&thread[i], nullptr, run_band, &band[i]) == 0;
  run_band(&band[0]);
  for (int i = 1; i < bands; ++i) {
    if (started[i]) {
      pthread_join(thread[i], nullptr);
    } else {
      run_band(&band[i]);  // no thread could be had: do the band here
    }
  }
}
