// The hardware base version as the decoder uses it: asked for once a process, since it is needed for
// every picture. Any thread.
#pragma once

int cachedHardwareBaseVersion();
