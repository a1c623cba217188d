#include "omxbridge/result.h"

#include <array>

namespace {

// Indexed by code. Kept: the double blanks are part of the texts that applications compare and print.
constexpr std::array<const char*, OMXI_ERR_APPLICATION + 1> kDescriptions = {
    "No errors.",
    "Could not Acquire Media Player Service",
    "Could not Create OmxInterface",
    "Could not Acquire iOMX Interface",
    "Could not Allocate OpenMax Component",
    "Could not Create OmxCodecObserver",
    "OMX Component Node Not Found.",
    "Buffers not registered by OMX component.  Pmem not available.",
    "Error filling buffer.",
    "Failed changing port setting.",
    "Interface entered an invalid state.",
    "Interface found to be in the incorrect state.",
    "OMX State was found to be not executing.",
    "Could not get port definition",
    "Could not set port definition",
    "Could not allocate memory",
    "Could not request IFrame.",
    "Could not get Bitrate Parameters",
    "Could not set Bitrate Parameters",
    "Could not set Codec Configuration",
    "Could not send Command State",
    "Could not set Execution State",
    "Could not create Event Thread",
    "Could not create Output Thread",
    "Invalid buffer passed.  Not found in buffer list.",
    "Buffer already owned.",
    "Buffer not emptied after deallocation.",
    "OMX Event Error received.  Check Logs for more details.",
    "Invalid Encoding Parameters submitted.",
    "Error: Could not setup surface renderer",
    "Error: Could not setup decoder picture order",
    "Error: Could not setup frame packing format",
    "Application Error.  See Logs for Details",
};

}  // namespace

const char* resultDescription(int code) {
  const auto index = static_cast<unsigned int>(code);  // negative codes become too large
  return index < kDescriptions.size() ? kDescriptions[index] : "Could not define result\n";
}
