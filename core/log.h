// The library's log lines: errors at priority 6 and warnings at priority 5, both without a tag.
// Any thread. The only callers of the platform's log besides the creation line of the C interface.
#pragma once

// Logs an error.
void logError(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Logs a warning.
void logWarning(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Logs an error and returns `code`, so that "log, map, return" is one statement.
[[nodiscard]] int failWith(int code, const char* format, ...) __attribute__((format(printf, 2, 3)));
