// String8, String16 and the way between them.
#include <stdio.h>
#include <string.h>

#include <utils/String16.h>
#include <utils/String8.h>

namespace android {

namespace {

constexpr char32_t kReplacement = 0xFFFD;

constexpr bool isHighSurrogate(char32_t unit) {
  return unit >= 0xD800 && unit < 0xDC00;
}
constexpr bool isLowSurrogate(char32_t unit) {
  return unit >= 0xDC00 && unit < 0xE000;
}

void appendUtf8(std::string& out, char32_t character) {
  const auto continuation = [&out](char32_t bits) { out += static_cast<char>(0x80 | (bits & 0x3F)); };
  if (character < 0x80) {
    out += static_cast<char>(character);
  } else if (character < 0x800) {
    out += static_cast<char>(0xC0 | (character >> 6));
    continuation(character);
  } else if (character < 0x10000) {
    out += static_cast<char>(0xE0 | (character >> 12));
    continuation(character >> 6);
    continuation(character);
  } else {
    out += static_cast<char>(0xF0 | (character >> 18));
    continuation(character >> 12);
    continuation(character >> 6);
    continuation(character);
  }
}

void appendUtf16(std::u16string& out, char32_t character) {
  if (character < 0x10000) {
    out += static_cast<char16_t>(character);
  } else {
    out += static_cast<char16_t>(0xD800 + ((character - 0x10000) >> 10));
    out += static_cast<char16_t>(0xDC00 + ((character - 0x10000) & 0x3FF));
  }
}

std::string toUtf8(std::u16string_view text) {
  std::string out;
  for (size_t i = 0; i < text.size(); ++i) {
    char32_t character = text[i];
    if (isHighSurrogate(character) && i + 1 < text.size() && isLowSurrogate(text[i + 1])) {
      character = 0x10000 + ((character - 0xD800) << 10) + (text[++i] - 0xDC00U);
    } else if (isHighSurrogate(character) || isLowSurrogate(character)) {
      character = kReplacement;
    }
    appendUtf8(out, character);
  }
  return out;
}

// One character from the front of `text`, which is not empty; U+FFFD and one byte where there is none.
char32_t takeUtf8(std::string_view& text) {
  const auto first = static_cast<unsigned char>(text[0]);
  size_t length = 1;
  char32_t smallest = 0;  // that needs this length
  char32_t character = first;
  if (first >= 0xF0 && first < 0xF8) {
    length = 4, smallest = 0x10000, character = first & 0x07U;
  } else if (first >= 0xE0 && first < 0xF0) {
    length = 3, smallest = 0x800, character = first & 0x0FU;
  } else if (first >= 0xC0 && first < 0xE0) {
    length = 2, smallest = 0x80, character = first & 0x1FU;
  } else if (first >= 0x80) {
    character = kReplacement;
  }
  bool whole = text.size() >= length;
  for (size_t i = 1; whole && i < length; ++i) {
    const auto next = static_cast<unsigned char>(text[i]);
    whole = (next & 0xC0U) == 0x80;
    character = (character << 6) | (next & 0x3FU);
  }
  if (!whole || character < smallest || character > 0x10FFFF || isHighSurrogate(character) ||
      isLowSurrogate(character)) {
    length = 1;
    character = kReplacement;
  }
  text.remove_prefix(length);
  return character;
}

std::u16string toUtf16(std::string_view text) {
  std::u16string out;
  while (!text.empty()) appendUtf16(out, takeUtf8(text));
  return out;
}

template <typename Char>
std::basic_string_view<Char> view(const Char* text) {
  return text != nullptr ? std::basic_string_view<Char>(text) : std::basic_string_view<Char>();
}

template <typename Char>
std::basic_string_view<Char> view(const Char* text, size_t count) {
  return text != nullptr ? std::basic_string_view<Char>(text, count) : std::basic_string_view<Char>();
}

__attribute__((format(printf, 2, 0))) void appendPrinted(std::string& out, const char* format,
                                                         va_list arguments) {
  va_list again;
  va_copy(again, arguments);
  // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the caller has started it
  const int length = vsnprintf(nullptr, 0, format, again);
  va_end(again);
  if (length <= 0) return;
  const size_t before = out.size();
  out.resize(before + static_cast<size_t>(length));
  vsnprintf(out.data() + before, static_cast<size_t>(length) + 1, format, arguments);
}

}  // namespace

String8::String8(const char* text) : _text(view(text)) {}
String8::String8(const char* text, size_t bytes) : _text(view(text, bytes)) {}
String8::String8(const String16& text) : _text(toUtf8(view(text.string(), text.size()))) {}
String8::String8(const char16_t* text) : _text(toUtf8(view(text))) {}
String8::String8(const char16_t* text, size_t units) : _text(toUtf8(view(text, units))) {}

String8& String8::operator=(const char* text) {
  setTo(text);
  return *this;
}

String8 String8::format(const char* format, ...) {
  String8 result;
  va_list arguments;
  va_start(arguments, format);
  appendPrinted(result._text, format, arguments);
  va_end(arguments);
  return result;
}

status_t String8::setTo(const char* text) {
  _text = view(text);
  return OK;
}

status_t String8::append(const String8& text) {
  _text += text._text;
  return OK;
}

status_t String8::append(const char* text) {
  _text += view(text);
  return OK;
}

status_t String8::append(const char* text, size_t bytes) {
  _text += view(text, bytes);
  return OK;
}

status_t String8::appendFormat(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  std::string printed;  // An argument may point into this string.
  appendPrinted(printed, format, arguments);
  va_end(arguments);
  _text += printed;
  return OK;
}

String8& String8::operator+=(const String8& text) {
  append(text);
  return *this;
}

String8& String8::operator+=(const char* text) {
  append(text);
  return *this;
}

String8 String8::operator+(const String8& text) const {
  return String8(*this) += text;
}
String8 String8::operator+(const char* text) const {
  return String8(*this) += text;
}

bool String8::operator==(const char* other) const {
  return _text == view(other);
}
std::strong_ordering String8::operator<=>(const char* other) const {
  return std::string_view(_text) <=> view(other);
}

ssize_t String8::find(const char* other, size_t start) const {
  const size_t found = _text.find(view(other), start);
  return found != std::string::npos ? static_cast<ssize_t>(found) : -1;
}

String16::String16(const char* text) : _text(toUtf16(view(text))) {}
String16::String16(const char* text, size_t bytes) : _text(toUtf16(view(text, bytes))) {}
String16::String16(const String8& text) : _text(toUtf16(view(text.string(), text.size()))) {}
String16::String16(const char16_t* text) : _text(view(text)) {}
String16::String16(const char16_t* text, size_t units) : _text(view(text, units)) {}

}  // namespace android
