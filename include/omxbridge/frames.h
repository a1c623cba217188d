/// @file
/// All frame functions: conversions between I420 and other pixel layouts, rotation, mirroring, scaling,
/// padding and cutting of raw pictures.
///
/// Pure functions on the caller's memory. They keep no state and take no locks, so any thread may call any
/// of them on frames of its own. Source and destination must not overlap unless a function says so. Nothing
/// is read outside the source frame and nothing written outside the destination frame, whatever the sizes.
/// Which vector instructions run is chosen once per process; the bytes are the same with all of them.
#pragma once

#include "omxbridge/frames/convert.h"
#include "omxbridge/frames/pad.h"
#include "omxbridge/frames/rgb.h"
#include "omxbridge/frames/rotate.h"
#include "omxbridge/frames/scale.h"
#include "omxbridge/frames/types.h"
#include "omxbridge/frames/yuv.h"
