// Pieces shared by the effects of the library: the registry row type, the
// common argument checks and the progress/cancellation scope.
#pragma once

#include <atomic>
#include <cstdint>

#include "iel.h"

// One row of the dispatcher's table.
struct IELEffectEntry {
  int16_t effect;
  // 0: any format the dispatcher accepts; otherwise the one format the
  // effect takes.
  int16_t format;
  // true: a wrong format is refused with 4 and nothing is logged.
  bool silent_format_refusal;
  int (*run)(structIELImage* input, structIELImage* output, structIELEffectParams* params);
};

// The registered effects, in one table; effects missing from it are refused
// as unsupported.
const IELEffectEntry* IEL_FindEffect(int effect);

// The checks every effect begins with, logged under the effect's own name:
// null descriptor or buffer (1), a width or height below the minimum (3), a
// format outside 1..6 or for which accepts(format) is false (4).
int IEL_CheckEffectImages(const char* function, const structIELImage* input, const structIELImage* output,
                          int min_width, int min_height, bool (*accepts)(int format));

// Progress and cancellation state. An effect that reports progress holds an
// IELProgressScope for its whole run: busy is set on entry, and on every exit
// the cancel request and busy are cleared.
namespace iel_progress {
extern std::atomic<uint32_t> busy;
extern std::atomic<uint8_t> cancel_request;
extern std::atomic<uint32_t> done;
extern std::atomic<uint32_t> total;
}  // namespace iel_progress

class IELProgressScope {
 public:
  // A cancel left pending by a request that raced the end of the previous
  // effect is dropped before this one starts.
  IELProgressScope() {
    iel_progress::cancel_request.store(0);
    iel_progress::busy.store(1);
  }
  ~IELProgressScope() {
    iel_progress::cancel_request.store(0);
    iel_progress::busy.store(0);
  }
  IELProgressScope(const IELProgressScope&) = delete;
  IELProgressScope& operator=(const IELProgressScope&) = delete;

  // The done count is cleared before the new total is published, so a
  // reader that sees the new total never pairs it with the last effect's
  // count (IEL_GetProgress reads the total first, with acquire order).
  void start(uint32_t total_units, uint32_t done_units = 0) {
    iel_progress::done.store(0, std::memory_order_relaxed);
    iel_progress::total.store(total_units, std::memory_order_release);
    iel_progress::done.store(done_units, std::memory_order_relaxed);
  }
  void advance(uint32_t units = 1) { iel_progress::done.fetch_add(units, std::memory_order_relaxed); }
  bool cancelled() const { return iel_progress::cancel_request.load(std::memory_order_relaxed) == 1; }
};
