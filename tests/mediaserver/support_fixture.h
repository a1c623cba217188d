#pragma once
// A scripted component behind a recording IOMX: for tests of the test support itself.

#include <memory>

#include "tests/mediaserver/node_fixture.h"
#include "tests/support/recording_omx.h"

namespace omxtest {

class Support : public NodeTest {
 protected:
  Support() : omx(new RecordingOmx(server)) {}

  std::unique_ptr<OmxClient> client() { return std::make_unique<OmxClient>(omx, kDecoder); }
  std::unique_ptr<OmxClient> running() {
    auto made = client();
    made->toExecuting();
    made->fillAll();
    return made;
  }
  MessageTap& tap() { return omx->messages(); }

  android::sp<RecordingOmx> omx;
};

}  // namespace omxtest
