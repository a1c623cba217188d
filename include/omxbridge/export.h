// Marks what libomxbridge.so exports; everything else stays hidden.
#pragma once
#define OMXBRIDGE_EXPORT __attribute__((visibility("default")))
