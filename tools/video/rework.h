// Turning, scaling, padding and cutting pictures with the library's frame functions.
#pragma once

#include "tools/video/picture.h"

namespace tool {

// The picture turned clockwise by 0, 90, 180 or 270 degrees: `scratch`, or the picture itself for 0.
const Picture& turned(const Picture& picture, int degrees, Picture& scratch);

// Each makes `to` of `from`, which must be another picture. Sizes are even.
void scale(const Picture& from, Size size, Picture& to);
// In the middle of a larger black picture.
void pad(const Picture& from, Size size, Picture& to);
// The middle of a picture that is at least that large.
void cut(const Picture& from, Size size, Picture& to);
// As large as it gets with the shape that it has, on black.
void fit(const Picture& from, Size size, Picture& to);

}  // namespace tool
