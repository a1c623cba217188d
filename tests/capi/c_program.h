// Sessions run from plain C, as an application would.
#pragma once

#ifdef __cplusplus
extern "C" {
#endif

// Both return 0, or the line of what went wrong. The encoder sends frames of 176x144 and expects `length`
// bytes of output for each; the decoder expects pictures of the given size in pixels, of three bytes each.
int runEncoderInC(unsigned int length);
int runDecoderInC(unsigned int width, unsigned int height);

#ifdef __cplusplus
}
#endif
