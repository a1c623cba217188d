#include "tools/video/scene.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace tool {

namespace {

constexpr int kGrainPeak = 2;  // grain is -2 to 2 levels of luma
constexpr size_t kGrainPeriod = 65536;
constexpr int kMouths = 4;
constexpr int kWheelSteps = 12;
constexpr int kWindowTop = 5;  // units
constexpr int kWindowWidth = 14;
constexpr int kWindowHeight = 16;
constexpr int kLeafSeeds = 4;
constexpr int kLeafSteps = 4;  // from one seed to the next

// The picture's height is 48 units, more or less.
int unitOf(Size size) {
  return std::max(1, std::min(size.width / 3 * 2, size.height) / 48);
}

int even(int value) {
  return value & ~1;
}

Size units(int unit, int width, int height) {
  return {std::max(2, even(width * unit)), std::max(2, even(height * unit))};
}

// How far the camera turns to each side.
Size panOf(Size size) {
  return {even(size.width / 10) + 2, even(size.height / 16) + 2};
}

int windowLeftOf(Size room) {
  return even(room.width / 12);
}

Canvas paintRoom(Size picture, int unit) {
  const Size pan = panOf(picture);
  Canvas room(Size{picture.width + 2 * pan.width, picture.height + 2 * pan.height});
  const int width = room.size().width;
  const int height = room.size().height;
  const int table = height * 3 / 4;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      // A wall lit from the left, and a table in front of it.
      const int light = 168 - 70 * x / width - 24 * y / height;
      const Colour wall{static_cast<uint8_t>(light), 122, 134};
      const Colour wood{static_cast<uint8_t>(104 + 20 * (y - table) / (height - table)), 108, 148};
      room.plot(x, y, y < table ? wall : wood);
    }
  }
  room.addNoise(0, 0, width, table, 9 * unit, 14, 1);
  room.addNoise(0, 0, width, table, std::max(2, unit / 2), 5, 2);
  room.addNoise(0, table, width, height - table, 4 * unit, 16, 3);
  room.addNoise(0, table, width, height - table, std::max(2, unit / 3), 10, 4);

  // A window, a shelf of books, a sheet of text.
  const int windowLeft = windowLeftOf(room.size());
  room.fill(windowLeft - unit, kWindowTop * unit - unit, (kWindowWidth + 2) * unit,
            (kWindowHeight + 2) * unit, {70, 126, 130});
  const int shelfLeft = width * 5 / 8;
  for (int book = 0; book < 16; ++book) {
    const uint32_t kind = scatter(static_cast<uint32_t>(book), 0, 5);
    const int tall = (8 + static_cast<int>(kind % 4)) * unit;
    const Colour cover{static_cast<uint8_t>(60 + kind / 7 % 110), static_cast<uint8_t>(104 + kind / 991 % 48),
                       static_cast<uint8_t>(104 + kind / 8191 % 48)};
    const int left = shelfLeft + book * 3 * unit / 2;
    room.fill(left, 15 * unit - tall, 3 * unit / 2 - std::max(1, unit / 6), tall, cover);
  }
  room.fill(shelfLeft - unit, 15 * unit, 26 * unit, unit, {62, 116, 140});
  const int sheetLeft = width * 5 / 8 + 2 * unit;
  room.fill(sheetLeft, 19 * unit, 18 * unit, 13 * unit, {214, 126, 128});
  room.writeText(sheetLeft + unit, 20 * unit, 16 * unit, 11 * unit, std::max(7, unit), 6);
  return room;
}

// Fills an ellipse with a colour that gets darker to the right and downwards, as a round body does.
Sprite paintBody(Size size, Colour colour, int shade, int grainCell, uint32_t seed) {
  Sprite body = makeEllipse(size);
  for (int y = 0; y < size.height; ++y) {
    for (int x = 0; x < size.width; ++x) {
      const int light = colour.y + shade / 2 - shade * x / size.width - shade * y / (2 * size.height);
      body.canvas.plot(x, y, {static_cast<uint8_t>(std::clamp(light, 0, 255)), colour.u, colour.v});
    }
  }
  body.canvas.addNoise(0, 0, size.width, size.height, std::max(2, grainCell), 7, seed);
  return body;
}

std::vector<Sprite> paintHeads(int unit) {
  std::vector<Sprite> heads;
  for (int mouth = 0; mouth < kMouths; ++mouth) {
    Sprite head = paintBody(units(unit, 14, 18), {158, 112, 150}, 44, unit, 7);
    const int width = head.canvas.size().width;
    head.canvas.fill(0, 0, width, 4 * unit, {52, 122, 134});  // hair
    head.canvas.addNoise(0, 0, width, 4 * unit, std::max(2, unit / 3), 22, 8);
    for (const int eye : {4, 9}) {
      head.canvas.fill(eye * unit, 7 * unit, 2 * unit, unit, {206, 128, 128});
      head.canvas.fill(eye * unit + unit / 2, 7 * unit, unit, unit, {40, 128, 128});
    }
    head.canvas.fill(5 * unit, 13 * unit, 4 * unit, std::max(1, unit / 2 + mouth * unit / 2), {84, 116, 168});
    heads.push_back(std::move(head));
  }
  return heads;
}

std::vector<Sprite> paintWheels(int unit) {
  std::vector<Sprite> wheels;
  const Size size = units(unit, 9, 9);
  for (int step = 0; step < kWheelSteps; ++step) {
    Sprite wheel = makeEllipse(size);
    // A turn by 30 degrees a step, in 1/16; the other steps follow by symmetry.
    constexpr std::array<int, 12> kCosine{16, 14, 8, 0, -8, -14, -16, -14, -8, 0, 8, 14};
    const int cosine = kCosine[static_cast<size_t>(step)];
    const int sine = kCosine[static_cast<size_t>((step + 9) % 12)];
    for (int y = 0; y < size.height; ++y) {
      for (int x = 0; x < size.width; ++x) {
        const int dx = 2 * x - size.width;
        const int dy = 2 * y - size.height;
        const bool along = dx * cosine + dy * sine > 0;
        const bool across = dy * cosine - dx * sine > 0;
        wheel.canvas.plot(x, y, along == across ? Colour{190, 90, 140} : Colour{88, 160, 110});
      }
    }
    wheels.push_back(std::move(wheel));
  }
  return wheels;
}

// Leaves in the wind, behind a window: no picture of them predicts the next one well.
std::vector<Sprite> paintLeaves(int unit) {
  std::vector<Sprite> views;
  const Size size = units(unit, kWindowWidth, kWindowHeight);
  const int cell = std::max(2, unit * 2 / 3);
  for (int view = 0; view < kLeafSeeds * kLeafSteps; ++view) {
    Sprite leaves(size);
    std::fill(leaves.rows.begin(), leaves.rows.end(), Sprite::Span{0, size.width});
    const auto seed = static_cast<uint32_t>(view / kLeafSteps);
    const int step = view % kLeafSteps;
    for (int y = 0; y < size.height; ++y) {
      for (int x = 0; x < size.width; ++x) {
        const int now = smoothNoise(x, y, cell, 60, 20 + seed);
        const int then = smoothNoise(x, y, cell, 60, 20 + (seed + 1) % kLeafSeeds);
        const int light = 120 + (now * (kLeafSteps - step) + then * step) / kLeafSteps;
        const bool isSky = light > 140;
        leaves.canvas.plot(x, y,
                           {static_cast<uint8_t>(light), static_cast<uint8_t>(isSky ? 140 : 108),
                            static_cast<uint8_t>(isSky ? 118 : 112)});
      }
    }
    leaves.canvas.fill(size.width / 2 - unit / 2, 0, unit, size.height, {70, 126, 130});
    leaves.canvas.fill(0, size.height / 2 - unit / 2, size.width, unit, {70, 126, 130});
    views.push_back(std::move(leaves));
  }
  return views;
}

// A strip of text as wide as the picture, twice side by side, so that it can run through without a seam.
Sprite paintTicker(Size picture, int unit) {
  Sprite strip(Size{2 * picture.width, std::max(2, even(3 * unit))});
  const int width = strip.canvas.size().width;
  const int height = strip.canvas.size().height;
  strip.canvas.fill(0, 0, width, height, {200, 132, 124});
  for (const int half : {0, picture.width}) {
    strip.canvas.writeText(half, unit / 2, picture.width, height, std::max(7, 3 * unit / 2), 9);
  }
  std::fill(strip.rows.begin(), strip.rows.end(), Sprite::Span{0, width});
  return strip;
}

// Stored as 0 to 2 * kGrainPeak, to be added to samples that were lowered by kGrainPeak.
std::vector<uint8_t> makeGrain(int width) {
  std::vector<uint8_t> grain(kGrainPeriod + static_cast<size_t>(width));
  for (size_t i = 0; i < grain.size(); ++i) {
    const uint32_t value = scatter(static_cast<uint32_t>(i), 0, 10);
    // The sum of two: small values are the most frequent.
    grain[i] = static_cast<uint8_t>(value % (kGrainPeak + 1) + value / 256 % (kGrainPeak + 1));
  }
  return grain;
}

}  // namespace

Scene::Scene(Size size, FrameRate rate)
    : _size(size),
      _traits{.rate = rate},
      _unit(unitOf(size)),
      _room(paintRoom(size, _unit)),
      _shoulders(paintBody(units(_unit, 34, 30), {86, 146, 116}, 40, 2 * _unit, 11)),
      _heads(paintHeads(_unit)),
      _wheels(paintWheels(_unit)),
      _leaves(paintLeaves(_unit)),
      _ball(paintBody(units(_unit, 6, 6), {140, 96, 176}, 90, _unit, 12)),
      _ticker(paintTicker(size, _unit)),
      _grain(makeGrain(size.width)) {}

void Scene::copyRoom(int left, int top, Picture& picture) const {
  const auto width = static_cast<size_t>(_size.width);
  uint8_t* target = picture.bytes.data();
  for (int y = 0; y < _size.height; ++y, target += width) memcpy(target, _room.luma(left, top + y), width);
  for (int y = 0; y < _size.height / 2; ++y, target += width / 2) {
    memcpy(target, _room.chromaU(left / 2, top / 2 + y), width / 2);
  }
  for (int y = 0; y < _size.height / 2; ++y, target += width / 2) {
    memcpy(target, _room.chromaV(left / 2, top / 2 + y), width / 2);
  }
}

void Scene::addGrain(Picture& picture) const {
  const auto width = static_cast<size_t>(_size.width);
  constexpr uint64_t kEach = 0x0101010101010101U;
  uint8_t* row = picture.bytes.data();
  for (int y = 0; y < _size.height; ++y, row += width) {
    const uint8_t* const grain =
        &_grain[scatter(static_cast<uint32_t>(_frame), static_cast<uint32_t>(y), 13) % kGrainPeriod];
    size_t x = 0;
    // Eight at a time in one word: samples stay within 18 to 232, so none borrows or carries.
    for (; x + 8 <= width; x += 8) {
      uint64_t samples = 0;
      uint64_t change = 0;
      memcpy(&samples, row + x, 8);
      memcpy(&change, grain + x, 8);
      samples = samples - kGrainPeak * kEach + change;
      memcpy(row + x, &samples, 8);
    }
    for (; x < width; ++x) row[x] = static_cast<uint8_t>(row[x] - kGrainPeak + grain[x]);
  }
}

Result<bool> Scene::next(Picture& picture) {
  picture.resize(_size);
  const Size pan = panOf(_size);
  const int panX = even(swing(_frame, 340, pan.width));
  const int panY = even(swing(_frame, 210, pan.height));
  copyRoom(pan.width + panX, pan.height + panY, picture);

  // The things in the room move with it, and by themselves.
  const int left = -panX;
  const int top = -panY;
  const int u = _unit;
  paint(_leaves[static_cast<size_t>(_frame % _leaves.size())], windowLeftOf(_room.size()) - pan.width + left,
        even(kWindowTop * u) - pan.height + top, picture);
  paint(_wheels[static_cast<size_t>(_frame / 2 % kWheelSteps)], even(left + _size.width / 10),
        even(top + 25 * u), picture);
  const int sway = swing(_frame, 130, 2 * u);
  paint(_shoulders, even(left + _size.width / 2 - 17 * u + sway / 2), even(top + 28 * u), picture);
  const size_t mouth = scatter(static_cast<uint32_t>(_frame / 4), 0, 14) % kMouths;
  paint(_heads[mouth], even(left + _size.width / 2 - 7 * u + sway),
        even(top + 12 * u + swing(_frame, 57, u / 2)), picture);
  const int bounce = std::abs(swing(_frame, 80, 16 * u));
  paint(_ball, even(static_cast<int>(_frame * 2 % static_cast<uint64_t>(_size.width + 12 * u)) - 6 * u),
        even(34 * u - bounce), picture);
  paint(_ticker, -static_cast<int>(_frame * 2 % static_cast<uint64_t>(_size.width)),
        even(_size.height - 4 * u), picture);
  addGrain(picture);
  ++_frame;
  return true;
}

}  // namespace tool
