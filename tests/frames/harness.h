// Runs a frame function on every instruction set that processor and build have, and compares result and every
// byte with a reference. Buffers end exactly where they should, for the address sanitizer.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <random>
#include <string>

#include "tests/frames/reference.h"

namespace frames_test {

using reference::Bytes;
using reference::Size;

// Noise with a fixed seed, with extremes among it.
class Content {
 public:
  explicit Content(std::uint32_t seed) : _random(seed) {}
  Bytes bytes(std::size_t size);
  unsigned number(unsigned low, unsigned high) { return std::uniform_int_distribution(low, high)(_random); }

 private:
  std::mt19937 _random;
};

// Fails the test if the bytes are not these ones.
void expectBytes(const Bytes& bytes, const Bytes& expected);

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
