// The test picture and timing loop the benchmark programs share.
#pragma once

#include <benchmark/benchmark.h>

#include <cstring>
#include <random>
#include <vector>

struct BenchPicture {
  int width = 0, height = 0;
  std::vector<int> in, out;
  std::vector<unsigned char> mask;  // all 0; a program fills it as it needs
};

// 1 MP (1024 x 1024) or 12 MP (4000 x 3000) of seeded random ARGB pixels, made
// once per program.
inline BenchPicture& bench_picture(int megapixels) {
  static BenchPicture one, twelve;
  BenchPicture& p = megapixels == 1 ? one : twelve;
  if (p.in.empty()) {
    p.width = megapixels == 1 ? 1024 : 4000;
    p.height = megapixels == 1 ? 1024 : 3000;
    const size_t n = static_cast<size_t>(p.width) * p.height;
    p.in.resize(n);
    p.out.resize(n);
    p.mask.assign(n, 0);
    std::mt19937 rng(1);
    for (int& v : p.in) v = static_cast<int>(rng());
  }
  return p;
}

// The floor every program measures beside its operations: one read and one
// write of the 12 MP (and 1 MP) picture. The summary of ./run bench divides
// every "/12" time of a program by its Memcpy/12 of the same run.
#define GLIMMER_BENCH_MEMCPY()                                                                     \
  void Memcpy(benchmark::State& state) {                                                           \
    bench_run(state, [](BenchPicture& p) { std::memcpy(p.out.data(), p.in.data(), p.in.size() * 4); }); \
  }                                                                                                \
  BENCHMARK(Memcpy)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime()

// Times op(picture) on the picture named by the benchmark's argument and
// reports megapixels a second.
template <class Op>
void bench_run(benchmark::State& state, Op op) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  for (auto _ : state) {
    op(p);
    benchmark::DoNotOptimize(p.out.data());
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(p.in.size()) * 4);
  state.counters["MPix/s"] = benchmark::Counter(static_cast<double>(state.iterations()) * p.in.size() / 1e6,
                                                benchmark::Counter::kIsRate);
}
