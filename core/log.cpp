#include "core/log.h"

#include <stdarg.h>

#include <android/log.h>

void logError(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  __android_log_vprint(ANDROID_LOG_ERROR, nullptr, format, arguments);
  va_end(arguments);
}

void logWarning(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  __android_log_vprint(ANDROID_LOG_WARN, nullptr, format, arguments);
  va_end(arguments);
}

int failWith(int code, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  __android_log_vprint(ANDROID_LOG_ERROR, nullptr, format, arguments);
  va_end(arguments);
  return code;
}
