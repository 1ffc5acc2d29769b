#include "if_utils_and.h"

#include "px_mem.h"

#include <sys/time.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

void* if_malloc(int size, const char*, int) {
  if (size < 1 || px_mem_take_failure()) return nullptr;
  void* p = std::malloc(static_cast<size_t>(size));
  px_mem_count(p, 1);
  return p;
}

void* if_calloc(int size, int count, const char*, int) {
  if (count <= 0 || size <= 0 || px_mem_take_failure()) return nullptr;
  void* p = std::calloc(static_cast<size_t>(count), static_cast<size_t>(size));
  px_mem_count(p, 1);
  return p;
}

void if_free(void* p, const char*, int) {
  px_mem_count(p, -1);
  std::free(p);
}

void* if_memset(void* d, int value, int n) {
  if (!d || n <= 0) return d;
  return std::memset(d, value, static_cast<size_t>(n));
}

void* if_memcpy(void* d, const void* s, size_t n, const char*, int) { return std::memcpy(d, s, n); }

int if_error_msg(const char* function, int line, const char* format, ...) {
  char message[200] = {};
  char text[400] = {};
  va_list ap;
  va_start(ap, format);
  std::vsnprintf(message, sizeof message, format, ap);
  va_end(ap);
  std::snprintf(text, sizeof text, "Func: %s() \t Line:%d \t ", function, line);
  std::strncat(text, message, sizeof text - std::strlen(text) - 1);
#if defined(__GNUC__)
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-security"
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
#endif
  // The composed line is the format text on purpose (see the header).
  return px_log_print(PX_LOG_ERROR, "KALO_PE:", text);
#if defined(__GNUC__)
#pragma GCC diagnostic pop
#endif
}

int if_get_time() {
  timeval tv;
  gettimeofday(&tv, nullptr);
  // Seconds * 1000 wraps in 32 bits; microseconds are rounded to the nearest
  // millisecond.
  unsigned int ms = static_cast<unsigned int>(tv.tv_sec) * 1000u;
  double t = static_cast<double>(static_cast<int>(ms)) + tv.tv_usec / 1000.0 + 0.5;
  return static_cast<int>(t);
}

long if_lrand() { return lrand48(); }

int if_sprintf(char* destination, const char* format, ...) {
  int conversions = 0;
  for (const char* p = format; *p; ++p) conversions += (*p == '%');
  if (conversions > 8) return 0;
  va_list ap;
  va_start(ap, format);
  int n = std::vsprintf(destination, format, ap);
  va_end(ap);
  return n;
}

int if_snprintf(char*, size_t, const char*, ...) { return 0; }

if_thread_record* if_create_thread(if_thread_fn function, void*, void* context) {
  auto* record = static_cast<if_thread_record*>(IF_CALLOC(sizeof(if_thread_record), 1));
  if (!record) {
    if_error_msg("if_create_thread", __LINE__, "Failed to allocate IEL thread memory \n");
    return nullptr;
  }
  record->context = context;
  record->function = function;
  return record;
}

int if_execute_threads(if_thread_record** handle, int a, int b) {
  if (!handle || !*handle) return 0;
  if_thread_record* record = *handle;
  if (record->function) record->function(record, a, b);
  return 1;
}

int if_delete_threads(if_thread_record** handle) {
  if (!handle || !*handle) return 1;
  IF_FREE((*handle)->owned);
  IF_FREE(*handle);
  *handle = nullptr;
  return 1;
}
