#include "px_log.h"

#include <atomic>
#include <cstdio>

#ifdef __ANDROID__
#include <android/log.h>
#endif

namespace {
std::atomic<px_log_sink> g_sink{nullptr};

int write_line(int priority, const char* tag, const char* fmt, va_list ap) {
#ifdef __ANDROID__
  return __android_log_vprint(priority, tag, fmt, ap);
#else
  char text[1024];
  int n = std::vsnprintf(text, sizeof text, fmt, ap);
  if (px_log_sink sink = g_sink.load()) {
    sink(priority, tag, text);
  } else {
    std::fprintf(stderr, "%c/%s %s\n", priority >= PX_LOG_ERROR ? 'E' : 'I', tag, text);
  }
  return n;
#endif
}
}  // namespace

int px_log_print(int priority, const char* tag, const char* fmt, ...) {
  va_list ap;
  va_start(ap, fmt);
  int n = write_line(priority, tag, fmt, ap);
  va_end(ap);
  return n;
}

void px_log_refusal(const char* method, const char* fmt, ...) {
  char why[256];
  va_list ap;
  va_start(ap, fmt);
  std::vsnprintf(why, sizeof why, fmt, ap);
  va_end(ap);
  px_log_print(PX_LOG_ERROR, "glimmerEngine", "%s: refused: %s", method, why);
}

void px_log_set_sink(px_log_sink sink) { g_sink.store(sink); }
