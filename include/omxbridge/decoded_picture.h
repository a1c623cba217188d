/// @file
/// What a decoder's output callback is told about a picture. For C and C++.
#pragma once

#include <stdint.h>

/// Values of DECODEDDATAINFO.dataType.
enum DecodedDataType {
  /// The component's own layout, unchanged: semi-planar YUV 4:2:0, a luma plane and then one plane of
  /// interleaved Cb and Cr bytes.
  DECODED_DATA_NATIVE = 0,
  /// RGB565 converted by the session, `width` x `height` pixels of 16 bits without padding, native byte
  /// order, red in the high bits (BT.601, limited range in).
  DECODED_DATA_RGB565 = 1,
  /// The component's own padded layout: rows of `width` bytes, `height` rows of luma, then height / 2
  /// rows of interleaved Cb and Cr. The picture is the crop rectangle: its luma at (cropLeft, cropTop),
  /// its chroma at (cropLeft, cropTop / 2) of the chroma plane.
  DECODED_DATA_CROPPED = 2
};

/// The description of one picture; valid during the callback. Fields are 32 bits wide.
typedef struct DECODEDDATAINFO {
  uint32_t width;       ///< of the output port, in pixels
  uint32_t height;      ///< of the output port, in pixels
  int32_t dataType;     ///< DecodedDataType
  uint32_t cropWidth;   ///< the visible rectangle, in pixels; all four are 0 but for DECODED_DATA_CROPPED
  uint32_t cropHeight;  ///< rows
  uint32_t cropLeft;    ///< columns left of it
  uint32_t cropTop;     ///< rows above it
} DECODEDDATAINFO;
