// What the built-in scene is painted with: integer arithmetic throughout, so the same on every machine.
#pragma once

#include <stdint.h>

#include <vector>

#include "tools/video/picture.h"

namespace tool {

struct Colour {
  uint8_t y;
  uint8_t u;
  uint8_t v;
};

// A number that looks random but depends on its arguments alone.
uint32_t scatter(uint32_t a, uint32_t b, uint32_t seed);

// Smooth noise from -amplitude to amplitude; bumps are `cell` pixels apart.
int smoothNoise(int x, int y, int cell, int amplitude, uint32_t seed);

// Swings between -amplitude and amplitude once in `period` steps, nearly as a sine does.
int swing(uint64_t step, int period, int amplitude);

// A picture being painted. Chroma has half the size; what is painted outside is cut off.
class Canvas {
 public:
  explicit Canvas(Size size);

  Size size() const { return _size; }
  int chromaWidth() const { return _size.width / 2; }

  // The luma of one pixel, with its chroma where the pixel is the first of its block of 2 x 2.
  void plot(int x, int y, Colour colour);
  void fill(int x, int y, int width, int height, Colour colour);
  // Rows of marks the size of letters, dark on what is there.
  void writeText(int x, int y, int width, int height, int letterHeight, uint32_t seed);
  void addNoise(int x, int y, int width, int height, int cell, int amplitude, uint32_t seed);

  const uint8_t* luma(int x, int y) const { return &_y[index(x, y, _size.width)]; }
  const uint8_t* chromaU(int x, int y) const { return &_u[index(x, y, chromaWidth())]; }
  const uint8_t* chromaV(int x, int y) const { return &_v[index(x, y, chromaWidth())]; }

 private:
  static size_t index(int x, int y, int width) {
    return static_cast<size_t>(y) * static_cast<size_t>(width) + static_cast<size_t>(x);
  }

  const Size _size;
  std::vector<uint8_t> _y;
  std::vector<uint8_t> _u;
  std::vector<uint8_t> _v;
};

// A shape that moves over the picture: a canvas of which each row shows from begin to end. Both are even,
// as are the sizes, so luma and chroma agree.
struct Sprite {
  struct Span {
    int begin = 0;
    int end = 0;
  };

  explicit Sprite(Size size) : canvas(size), rows(static_cast<size_t>(size.height)) {}

  Canvas canvas;
  std::vector<Span> rows;
};

// A sprite that shows the ellipse which fills the canvas.
Sprite makeEllipse(Size size);

// Paints the sprite with its top left corner at (x, y), both even; cut off at the edges.
void paint(const Sprite& sprite, int x, int y, Picture& picture);

}  // namespace tool
