// String16: a UTF-16 string, the form in which binder names services and interfaces.
// A null pointer counts as an empty string. Ordered by units.
#pragma once

#include <stddef.h>

#include <compare>
#include <string>

namespace android {

class String8;

class String16 {
 public:
  String16() = default;
  // UTF-8; bytes that form no character become U+FFFD.
  explicit String16(const char* text);
  String16(const char* text, size_t bytes);
  explicit String16(const String8& text);
  explicit String16(const char16_t* text);
  String16(const char16_t* text, size_t units);

  const char16_t* string() const { return _text.c_str(); }
  operator const char16_t*() const { return string(); }
  size_t size() const { return _text.size(); }

  bool operator==(const String16& other) const = default;
  // NOLINTNEXTLINE(modernize-use-nullptr): trips over the defaulted operator
  std::strong_ordering operator<=>(const String16& other) const = default;

 private:
  std::u16string _text;
};

}  // namespace android
