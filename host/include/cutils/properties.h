// System properties: short texts by name, readable and settable from any thread.
// The posed device provides the first values (see omxhost/device.h).
#pragma once

#define PROPERTY_KEY_MAX 32  // terminators included
#define PROPERTY_VALUE_MAX 92

#ifdef __cplusplus
extern "C" {
#endif

// Copies the value, at most 91 characters, and a terminator into `value`, which has room for
// PROPERTY_VALUE_MAX bytes, and returns its length. A property that is unset or empty gives
// `default_value`, or an empty text where that is null.
int property_get(const char* key, char* value, const char* default_value);

// 0, or -1 where the name is empty or either text is too long. A null value empties the property.
int property_set(const char* key, const char* value);

#ifdef __cplusplus
}
#endif
