#include "omxbridge/omxbridge.h"

const char* const g_strPrgCreatTime = __DATE__ ", " __TIME__;
