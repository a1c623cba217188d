/// @file
/// Marks what libomxbridge.so exports; everything else stays hidden.
#pragma once
/// Stands in front of each exported declaration.
#define OMXBRIDGE_EXPORT __attribute__((visibility("default")))
