// Interface layer of the effect library: checked allocation, the diagnostic
// log, a millisecond clock, random numbers, a bounded formatted print and a
// handle for deferred work. Stateless.
#pragma once

#include <cstddef>

#include "px_log.h"

// The caller's file and line are carried for diagnostics and otherwise unused.
void* if_malloc(int size, const char* file, int line);             // null if size < 1
void* if_calloc(int size, int count, const char* file, int line);  // null unless both > 0
void if_free(void* p, const char* file, int line);                 // ignores null
void* if_memset(void* d, int value, int n);  // d untouched if null or n <= 0
void* if_memcpy(void* d, const void* s, size_t n, const char* file, int line);

#define IF_MALLOC(size) if_malloc((size), __FILE__, __LINE__)
#define IF_CALLOC(size, count) if_calloc((size), (count), __FILE__, __LINE__)
#define IF_FREE(p) if_free((p), __FILE__, __LINE__)

// Logs "Func: <function>() \t Line:<line> \t <message>" at error priority
// under the tag "KALO_PE:". The message is formatted into 200 bytes and the
// line into 400 (both bounded: longer text is cut). The composed line is
// handed to the log as its format text, so a message must not expand to a
// bare per-cent sign. Returns the log call's result.
int if_error_msg(const char* function, int line, const char* format, ...) PX_PRINTF_LIKE(3, 4);

#define IF_ERROR(...) if_error_msg(__func__, __LINE__, __VA_ARGS__)

// Wall-clock milliseconds as a wrapping 32-bit value; only differences mean
// anything.
int if_get_time();

// lrand48(); the library never seeds it.
long if_lrand();

// sprintf for formats of at most eight conversions of 32-bit values: a
// format with more than eight '%' characters ("%%" counts twice) writes
// nothing and returns 0.
int if_sprintf(char* destination, const char* format, ...) PX_PRINTF_LIKE(2, 3);

// Writes nothing and returns 0.
int if_snprintf(char* destination, size_t size, const char* format, ...);

// Deferred work: a record that holds a function and its context; executing
// the handle runs the function on the calling thread.
struct if_thread_record;
using if_thread_fn = void (*)(if_thread_record* record, int a, int b);
struct if_thread_record {
  unsigned char flag0;
  unsigned char flag1;
  void* owned;  // optional buffer owned by the record, freed with it
  void* context;
  if_thread_fn function;
};

// Returns a new record, or null (logged) when it cannot be allocated.
if_thread_record* if_create_thread(if_thread_fn function, void* unused, void* context);
// Runs function(record, a, b) and returns 1; 0 without a record.
int if_execute_threads(if_thread_record** handle, int a, int b);
// Frees the record and its owned buffer and clears the handle; returns 1.
int if_delete_threads(if_thread_record** handle);
