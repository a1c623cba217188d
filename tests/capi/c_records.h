// Sizes and offsets of the public records as a C compiler sees them.
#pragma once

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

// In the order of recordLayout() in abi_layout_test.cpp.
extern const size_t cRecordLayout[];
extern const size_t cRecordLayoutCount;

#ifdef __cplusplus
}
#endif
