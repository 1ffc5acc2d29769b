// Row splitting for the fast paths. Work is split into bands of rows, each
// run on a POSIX worker thread created and joined inside the call; the
// calling thread takes the first band. Results never depend on the number of
// threads: every band writes only its own rows.
//
// The scalar switch (environment variable GLIMMER_SCALAR=1 at load time, or
// px_set_scalar_only) forces the plain single-threaded path everywhere, so the
// tests can compare both.
//
// The number of bands is at most the number of cores (and 8); the environment
// variable GLIMMER_THREADS=n at load time, or px_set_thread_count(n), caps it
// at n (0: no cap). The benchmarks use it to measure one and two threads.
#pragma once

bool px_scalar_only();
void px_set_scalar_only(bool on);
void px_set_thread_count(int threads);
// Threads a large job is split over now (1..8).
int px_thread_count();

// Number of bands a job of `rows` rows is split into (1 when scalar-only).
int px_band_count(int rows, int min_rows_per_band);

using px_band_fn = void (*)(void* context, int y0, int y1);
void px_run_bands(int rows, int min_rows_per_band, px_band_fn fn, void* context);

// Calls body(y0, y1) over disjoint bands covering [0, rows).
template <class Body>
void px_for_rows(int rows, Body&& body, int min_rows_per_band = 64) {
  px_run_bands(
      rows, min_rows_per_band,
      [](void* c, int y0, int y1) { (*static_cast<Body*>(c))(y0, y1); }, &body);
}
