// As the platform's headers before C++11 have it: types with the names of today's keywords.
#pragma once

#include <stdint.h>

extern "C" {

typedef uint32_t char32_t;
typedef uint16_t char16_t;

// What the platform's own functions were compiled with, and so their names.
static_assert(__is_same(char16_t, uint16_t) && __is_same(char32_t, uint32_t));

int strzcmp16(const char16_t* left, size_t leftSize, const char16_t* right, size_t rightSize);
}
