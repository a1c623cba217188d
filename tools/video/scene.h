// The built-in test scene: somebody talking in a room, a camera that is never quite still, things that
// move, a line of running text, and the grain of a sensor. The same pictures every time, for any size.
#pragma once

#include <vector>

#include "tools/files/frame_source.h"
#include "tools/video/canvas.h"

namespace tool {

class Scene : public FrameSource {
 public:
  Scene(Size size, FrameRate rate);

  Size size() const override { return _size; }
  const VideoTraits& traits() const override { return _traits; }
  std::optional<uint64_t> frameCount() const override { return std::nullopt; }  // it never ends
  Result<bool> next(Picture& picture) override;

 private:
  void copyRoom(int left, int top, Picture& picture) const;
  void addGrain(Picture& picture) const;

  const Size _size;
  const VideoTraits _traits;
  const int _unit;  // pixels; all proportions are in it
  const Canvas _room;
  const Sprite _shoulders;
  const std::vector<Sprite> _heads;   // mouth closed to open
  const std::vector<Sprite> _wheels;  // one step of a turn each
  const std::vector<Sprite> _leaves;  // behind the window
  const Sprite _ball;
  const Sprite _ticker;
  const std::vector<uint8_t> _grain;
  uint64_t _frame = 0;
};

}  // namespace tool
