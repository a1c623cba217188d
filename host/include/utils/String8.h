// String8: a UTF-8 string. A null pointer counts as an empty string. Ordered by bytes.
#pragma once

#include <stdarg.h>
#include <stddef.h>

#include <compare>
#include <string>

#include <utils/Errors.h>

namespace android {

class String16;

class String8 {
 public:
  String8() = default;
  explicit String8(const char* text);
  String8(const char* text, size_t bytes);
  // Units that form no character become U+FFFD.
  explicit String8(const String16& text);
  explicit String8(const char16_t* text);
  String8(const char16_t* text, size_t units);

  String8& operator=(const char* text);

  static String8 format(const char* format, ...) __attribute__((format(printf, 1, 2)));

  const char* string() const { return _text.c_str(); }
  operator const char*() const { return string(); }
  size_t size() const { return _text.size(); }
  size_t length() const { return _text.size(); }
  size_t bytes() const { return _text.size(); }
  bool isEmpty() const { return _text.empty(); }

  void clear() { _text.clear(); }
  void setTo(const String8& text) { *this = text; }
  status_t setTo(const char* text);
  status_t append(const String8& text);
  status_t append(const char* text);
  status_t append(const char* text, size_t bytes);
  status_t appendFormat(const char* format, ...) __attribute__((format(printf, 2, 3)));

  String8& operator+=(const String8& text);
  String8& operator+=(const char* text);
  String8 operator+(const String8& text) const;
  String8 operator+(const char* text) const;

  // Negative, zero or positive, as strcmp().
  int compare(const String8& other) const { return _text.compare(other._text); }
  bool operator==(const String8& other) const { return _text == other._text; }
  bool operator==(const char* other) const;
  std::strong_ordering operator<=>(const String8& other) const { return _text <=> other._text; }
  std::strong_ordering operator<=>(const char* other) const;

  // The offset of `other` at or behind `start`, or -1.
  ssize_t find(const char* other, size_t start = 0) const;

 private:
  std::string _text;
};

}  // namespace android
