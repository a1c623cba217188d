#include "tests/capi/c_records.h"

#include "omxbridge/omxbridge.h"

typedef struct VideoCodec VideoCodec;
typedef struct VideoCodecH264 VideoCodecH264;

const size_t cRecordLayout[] = {
#include "tests/capi/record_layout.inl"
};
const size_t cRecordLayoutCount = sizeof(cRecordLayout) / sizeof(cRecordLayout[0]);
