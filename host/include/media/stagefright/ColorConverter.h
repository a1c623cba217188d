// ColorConverter: decoder pictures to RGB565 for display. This port converts what the tiled decoders
// deliver: 64x32-tiled semi-planar YUV 4:2:0 (0x7FA30C03), BT.601 limited range.
// An object holds no state besides its formats and may be used by several threads.
#pragma once

#include <stddef.h>

#include <OMX_IVCommon.h>
#include <utils/Errors.h>

namespace android {

struct ColorConverter {
  ColorConverter(OMX_COLOR_FORMATTYPE from, OMX_COLOR_FORMATTYPE to);
  ColorConverter(const ColorConverter&) = delete;
  ColorConverter& operator=(const ColorConverter&) = delete;

  // Whether convert() knows this pair of formats.
  bool isValid() const;

  // Converts the crop rectangle of the source into that of the destination. Sizes and crops are in
  // pixels, crop corners inclusive. The source holds the tiles of a picture of its width and height:
  // luma, rounded up to 8192 bytes, then chroma. The destination's rows are dstWidth 16-bit words in
  // native order.
  // ERROR_UNSUPPORTED, with nothing written: formats that are not valid, an odd left edge of the source
  // crop, crops of unequal size, crops that are empty or reach beyond their pictures, sides above 16384
  // pixels, null pointers.
  status_t convert(const void* srcBits, size_t srcWidth, size_t srcHeight, size_t srcCropLeft,
                   size_t srcCropTop, size_t srcCropRight, size_t srcCropBottom, void* dstBits,
                   size_t dstWidth, size_t dstHeight, size_t dstCropLeft, size_t dstCropTop,
                   size_t dstCropRight, size_t dstCropBottom);

 private:
  const OMX_COLOR_FORMATTYPE _from;
  const OMX_COLOR_FORMATTYPE _to;
};

}  // namespace android
