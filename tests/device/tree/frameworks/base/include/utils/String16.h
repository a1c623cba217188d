// What the library uses of String16, in the words of that time.
#pragma once

#include <stddef.h>

#include <utils/Unicode.h>

namespace android {

class String16 {
 public:
  String16();
  String16(const String16& other);
  explicit String16(const char* text);
  explicit String16(const char16_t* text);
  ~String16();

  inline const char16_t* string() const { return mString; }
  size_t size() const;
  inline bool operator==(const String16& other) const {
    return strzcmp16(string(), size(), other.string(), other.size()) == 0;
  }

 private:
  const char16_t* mString;
};

}  // namespace android
