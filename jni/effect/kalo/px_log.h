// The platform log. On Android every line goes to __android_log_print; on
// other systems to stderr, and a test can install a sink that receives each
// line instead.
#pragma once

#include <cstdarg>

#if defined(__GNUC__)
#define PX_PRINTF_LIKE(fmt, args) __attribute__((format(printf, fmt, args)))
#else
#define PX_PRINTF_LIKE(fmt, args)
#endif

enum { PX_LOG_ERROR = 6 };

// Writes one line; `text` is used as a printf format, as on the platform.
int px_log_print(int priority, const char* tag, const char* fmt, ...) PX_PRINTF_LIKE(3, 4);

// Logs a refusal of bad input from the bridge (tag "glimmerEngine").
void px_log_refusal(const char* method, const char* fmt, ...) PX_PRINTF_LIKE(2, 3);

// Test hook: when set, each formatted line is handed to the sink instead of
// stderr. Has no effect on Android. Pass null to restore stderr.
using px_log_sink = void (*)(int priority, const char* tag, const char* text);
void px_log_set_sink(px_log_sink sink);
