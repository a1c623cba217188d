// Runs a frame function on every instruction set that processor and build have, on buffers that end exactly
// where they should, and compares result and every byte with a reference.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <random>
#include <string>

#include "tests/frames/reference.h"

namespace frames_test {

using reference::Bytes;
using reference::Size;

// Test content with a fixed seed: noise, extremes only, or a flat value.
class Content {
 public:
  explicit Content(std::uint32_t seed) : _random(seed) {}
  Bytes bytes(std::size_t size);
  unsigned number(unsigned low, unsigned high) { return std::uniform_int_distribution(low, high)(_random); }

 private:
  std::mt19937 _random;
};

// A copy of bytes on the heap. The allocation ends with the last byte, so that the address sanitizer sees
// what runs over; lead bytes before the first give it another alignment and are watched here.
class ExactBuffer {
 public:
  ExactBuffer(const Bytes& bytes, std::size_t lead);
  std::uint8_t* data() { return _memory.get() + _lead; }
  // Fails the test if the bytes are not these ones, or something was written before them.
  void expect(const Bytes& bytes) const;

 private:
  std::size_t _lead, _size;
  std::unique_ptr<std::uint8_t[]> _memory;
};

// Calls body once per instruction set, with its name traced.
void onEveryTarget(const std::function<void()>& body);

// A function from src to dst. expected: dst after the call; before it dst holds what dst is here.
using Conversion = std::function<int(const std::uint8_t* src, std::uint8_t* dst)>;
void expectConversion(const Conversion& call, const Bytes& src, const Bytes& dst, const Bytes& expected,
                      int result);

// A function that works on buffer in place.
using InPlace = std::function<int(std::uint8_t* buffer)>;
void expectInPlace(const InPlace& call, const Bytes& buffer, const Bytes& expected, int result);

// Every width from 1 past two of the longest vectors of any kernel, each with a few heights, and some odd
// sizes.
void forEachSize(const std::function<void(Size)>& body);

std::string text(Size s);

}  // namespace frames_test
