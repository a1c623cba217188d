#pragma once
// One media server with a scripted decoder and encoder, without the service manager, and clients of it.

#include <gtest/gtest.h>

#include <memory>

#include "host/mediaserver/omx_server.h"
#include "tests/support/omx_client.h"
#include "tests/support/script.h"

namespace omxtest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::kPortCount;
using mediaserver::PortDefinition;
using Words = std::vector<std::string>;

inline constexpr const char* kDecoder = "decoder";
inline constexpr const char* kEncoder = "encoder";

inline android::status_t okIf(bool expected) {
  return expected ? kOk : kUnknownError;
}

inline Match errorIs(OMX_ERRORTYPE code) {
  return eventIs(OMX_EventError, static_cast<OMX_U32>(code));
}

class NodeTest : public ::testing::Test {
 protected:
  NodeTest() {
    // Few and small buffers: what counts is who has them.
    for (OMX_U32 port = 0; port < kPortCount; ++port) {
      for (Script* script : {&decoder, &encoder}) {
        script->editPort(port, [](PortDefinition& definition) {
          definition.nBufferCountActual = 2;
          definition.nBufferSize = 64;
        });
      }
    }
    // Waits for ever for clients that keep their output.
    server = new mediaserver::OmxServer({decoder.component(kDecoder), encoder.component(kEncoder)},
                                        std::chrono::hours(1));
  }
  ~NodeTest() override { EXPECT_EQ(server->nodeCount(), 0u); }

  std::unique_ptr<OmxClient> client(const char* component = kDecoder) {
    return std::make_unique<OmxClient>(server, component);
  }

  // A node in Executing that holds all its output buffers.
  std::unique_ptr<OmxClient> running(const char* component = kDecoder) {
    std::unique_ptr<OmxClient> made = client(component);
    made->toExecuting();
    made->fillAll();
    return made;
  }

  // Brings a fresh node into `state` by legal steps, and forgets the messages of the way.
  static void reach(OmxClient* node, OMX_STATETYPE state) {
    if (state != OMX_StateLoaded && state != OMX_StateWaitForResources) node->toIdle();
    if (state != OMX_StateLoaded && state != OMX_StateIdle) node->complete(OMX_CommandStateSet, state);
    node->messages().clear();
  }

  // Returns when everything that the node was told before has been carried out and heard, as far as it
  // does not wait for the client. What a mark gives is an error, and it comes last.
  static void settle(OmxClient* node) {
    const Match marked = errorIs(OMX_ErrorNotImplemented);
    const size_t before = node->messages().count(marked);
    EXPECT_EQ(node->command(OMX_CommandMarkBuffer, 0), android::OK);
    node->expect(marked, before + 1);
  }

  Script decoder{Script::Kind::Decoder};
  Script encoder{Script::Kind::Encoder};
  android::sp<mediaserver::OmxServer> server;
};

}  // namespace omxtest
