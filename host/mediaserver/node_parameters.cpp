// Parameters and configurations. The codec is asked first; what it does not answer and concerns ports in
// general is answered here.

#include <algorithm>
#include <cstring>

#include "host/mediaserver/node.h"

namespace mediaserver {

namespace {

// Every record starts with its size and version; none that exists comes near the upper limit.
constexpr size_t kLeastRecord = 2 * sizeof(OMX_U32);
constexpr size_t kLargestRecord = 65536;

bool plausible(const void* record, size_t size) {
  return record != nullptr && size >= kLeastRecord && size <= kLargestRecord;
}

// The record as a T; false when the client's record is too short to be one. What the record's own size
// word says does not matter: some clients leave it empty, or use it for something else.
template <typename T>
bool read(const std::vector<uint8_t>& bytes, T* record) {
  if (bytes.size() < sizeof(T)) return false;
  std::memcpy(record, bytes.data(), sizeof(T));
  return true;
}

// Writes all of the record but the size and version words, which are the client's.
template <typename T>
void write(const T& record, std::vector<uint8_t>* bytes) {
  std::memcpy(bytes->data() + kLeastRecord, reinterpret_cast<const uint8_t*>(&record) + kLeastRecord,
              sizeof(T) - kLeastRecord);
}

}  // namespace

OMX_ERRORTYPE Node::getParameter(OMX_INDEXTYPE index, void* record, size_t size) {
  if (!plausible(record, size)) return OMX_ErrorBadParameter;
  if (state() == OMX_StateInvalid) return OMX_ErrorInvalidState;
  const auto* const bytes = static_cast<const uint8_t*>(record);
  Record copy(bytes, bytes + size);
  const Codec::Answer answer = _codec->getParameter(index, copy.data(), size);
  const OMX_ERRORTYPE result = answer.has_value() ? *answer : getStandard(index, copy);
  if (result == OMX_ErrorNone) std::memcpy(record, copy.data(), size);
  return result;
}

OMX_ERRORTYPE Node::setParameter(OMX_INDEXTYPE index, const void* record, size_t size) {
  if (!plausible(record, size)) return OMX_ErrorBadParameter;
  const auto* const bytes = static_cast<const uint8_t*>(record);
  const Record copy(bytes, bytes + size);
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (!usable()) return OMX_ErrorInvalidState;
    if (!writable(copy.data(), size)) return OMX_ErrorIncorrectStateOperation;
  }
  const Codec::Answer answer = _codec->setParameter(index, copy.data(), size);
  return answer.has_value() ? *answer : setStandard(index, copy);
}

OMX_ERRORTYPE Node::getConfig(OMX_INDEXTYPE index, void* record, size_t size) {
  if (!plausible(record, size)) return OMX_ErrorBadParameter;
  if (state() == OMX_StateInvalid) return OMX_ErrorInvalidState;
  const auto* const bytes = static_cast<const uint8_t*>(record);
  Record copy(bytes, bytes + size);
  const OMX_ERRORTYPE result =
      _codec->getConfig(index, copy.data(), size).value_or(OMX_ErrorUnsupportedIndex);
  if (result == OMX_ErrorNone) std::memcpy(record, copy.data(), size);
  return result;
}

OMX_ERRORTYPE Node::setConfig(OMX_INDEXTYPE index, const void* record, size_t size) {
  if (!plausible(record, size)) return OMX_ErrorBadParameter;
  if (state() == OMX_StateInvalid) return OMX_ErrorInvalidState;
  const auto* const bytes = static_cast<const uint8_t*>(record);
  const Record copy(bytes, bytes + size);
  return _codec->setConfig(index, copy.data(), size).value_or(OMX_ErrorUnsupportedIndex);
}

OMX_ERRORTYPE Node::extensionIndex(const char* name, OMX_INDEXTYPE* index) {
  if (name == nullptr || index == nullptr) return OMX_ErrorBadParameter;
  if (state() == OMX_StateInvalid) return OMX_ErrorInvalidState;
  for (const Extension& extension : _codec->extensions()) {
    if (extension.name != name) continue;
    *index = extension.index;
    return OMX_ErrorNone;
  }
  return OMX_ErrorUnsupportedIndex;
}

// Parameters are written in Loaded, before it is left, and on disabled ports.
bool Node::writable(const uint8_t* record, size_t size) const {
  if (_state == OMX_StateLoaded && _target == OMX_StateLoaded) return true;
  OMX_U32 port = kPortCount;
  if (size >= kLeastRecord + sizeof(port)) std::memcpy(&port, record + kLeastRecord, sizeof(port));
  return port < kPortCount && !_ports[port].enabled();
}

OMX_ERRORTYPE Node::getStandard(OMX_INDEXTYPE index, Record& record) {
  switch (index) {
    case OMX_IndexParamVideoInit:
    case OMX_IndexParamAudioInit:
    case OMX_IndexParamImageInit:
    case OMX_IndexParamOtherInit: {
      OMX_PORT_PARAM_TYPE ports;
      if (!read(record, &ports)) return OMX_ErrorBadParameter;
      ports.nPorts = index == OMX_IndexParamVideoInit ? kPortCount : 0;
      ports.nStartPortNumber = 0;
      write(ports, &record);
      return OMX_ErrorNone;
    }
    case OMX_IndexParamStandardComponentRole: {
      OMX_PARAM_COMPONENTROLETYPE role;
      if (!read(record, &role)) return OMX_ErrorBadParameter;
      if (_component.roles.empty()) return OMX_ErrorUnsupportedSetting;
      std::memset(role.cRole, 0, sizeof(role.cRole));
      _component.roles.front().copy(reinterpret_cast<char*>(role.cRole), sizeof(role.cRole) - 1);
      write(role, &record);
      return OMX_ErrorNone;
    }
    case OMX_IndexParamPortDefinition: {
      PortDefinition definition;
      if (!read(record, &definition)) return OMX_ErrorBadParameter;
      if (definition.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
      std::lock_guard<std::mutex> lock(_mutex);
      write(_ports[definition.nPortIndex].definition, &record);
      return OMX_ErrorNone;
    }
    case OMX_IndexParamVideoPortFormat: {
      OMX_VIDEO_PARAM_PORTFORMATTYPE format;
      if (!read(record, &format)) return OMX_ErrorBadParameter;
      if (format.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
      const std::vector<VideoFormat> formats = _codec->formats(format.nPortIndex);
      if (format.nIndex >= formats.size()) return OMX_ErrorNoMore;
      format.eCompressionFormat = formats[format.nIndex].compression;
      format.eColorFormat = formats[format.nIndex].colour;
      {
        std::lock_guard<std::mutex> lock(_mutex);
        format.xFramerate = _ports[format.nPortIndex].definition.format.video.xFramerate;
      }
      write(format, &record);
      return OMX_ErrorNone;
    }
    case OMX_IndexParamCompBufferSupplier: {
      OMX_PARAM_BUFFERSUPPLIERTYPE supplier;
      if (!read(record, &supplier)) return OMX_ErrorBadParameter;
      if (supplier.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
      std::lock_guard<std::mutex> lock(_mutex);
      supplier.eBufferSupplier = _ports[supplier.nPortIndex].supplier;
      write(supplier, &record);
      return OMX_ErrorNone;
    }
    default:
      return OMX_ErrorUnsupportedIndex;
  }
}

OMX_ERRORTYPE Node::setStandard(OMX_INDEXTYPE index, const Record& record) {
  switch (index) {
    case OMX_IndexParamStandardComponentRole: {
      OMX_PARAM_COMPONENTROLETYPE role;
      if (!read(record, &role)) return OMX_ErrorBadParameter;
      const char* const name = reinterpret_cast<const char*>(role.cRole);
      const std::string wanted(name, strnlen(name, sizeof(role.cRole)));
      const auto& roles = _component.roles;
      return std::find(roles.begin(), roles.end(), wanted) != roles.end() ? OMX_ErrorNone
                                                                          : OMX_ErrorUnsupportedSetting;
    }
    case OMX_IndexParamPortDefinition: {
      PortDefinition definition;
      if (!read(record, &definition)) return OMX_ErrorBadParameter;
      return define(definition.nPortIndex, definition);
    }
    case OMX_IndexParamVideoPortFormat: {
      OMX_VIDEO_PARAM_PORTFORMATTYPE format;
      if (!read(record, &format)) return OMX_ErrorBadParameter;
      if (format.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
      PortDefinition wanted;
      {
        std::lock_guard<std::mutex> lock(_mutex);
        wanted = _ports[format.nPortIndex].definition;
      }
      wanted.format.video.eCompressionFormat = format.eCompressionFormat;
      wanted.format.video.eColorFormat = format.eColorFormat;
      if (format.xFramerate != 0) wanted.format.video.xFramerate = format.xFramerate;
      return define(format.nPortIndex, wanted);
    }
    case OMX_IndexParamCompBufferSupplier: {
      OMX_PARAM_BUFFERSUPPLIERTYPE supplier;
      if (!read(record, &supplier)) return OMX_ErrorBadParameter;
      if (supplier.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
      if (supplier.eBufferSupplier > OMX_BufferSupplyOutput) return OMX_ErrorBadParameter;
      std::lock_guard<std::mutex> lock(_mutex);
      _ports[supplier.nPortIndex].supplier = supplier.eBufferSupplier;
      return OMX_ErrorNone;
    }
    default:
      return OMX_ErrorUnsupportedIndex;
  }
}

bool Node::offers(OMX_U32 port, VideoFormat format) const {
  const std::vector<VideoFormat> formats = _codec->formats(port);
  return std::any_of(formats.begin(), formats.end(), [&](const VideoFormat& offered) {
    return offered.compression == format.compression && offered.colour == format.colour;
  });
}

OMX_ERRORTYPE Node::define(OMX_U32 index, PortDefinition wanted) {
  if (index >= kPortCount) return OMX_ErrorBadPortIndex;
  for (;;) {
    PortPair ports;
    unsigned revision = 0;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      ports = definitions();
      revision = _revision;
    }
    // Clients write counts, sizes and the picture; addresses in the record are theirs and mean nothing here.
    const PortDefinition asked = wanted;
    wanted = ports[index];
    wanted.nBufferCountActual = asked.nBufferCountActual;
    wanted.nBufferSize = asked.nBufferSize;
    wanted.format.video = asked.format.video;
    wanted.format.video.cMIMEType = ports[index].format.video.cMIMEType;
    wanted.format.video.pNativeRender = ports[index].format.video.pNativeRender;
    wanted.format.video.pNativeWindow = ports[index].format.video.pNativeWindow;
    auto& video = wanted.format.video;
    // Kept: clients write a colour format to compressed ports too, where it has no meaning.
    if (video.eCompressionFormat != OMX_VIDEO_CodingUnused) video.eColorFormat = OMX_COLOR_FormatUnused;
    if (!offers(index, {video.eCompressionFormat, video.eColorFormat})) return OMX_ErrorUnsupportedSetting;
    if (wanted.nBufferCountActual < wanted.nBufferCountMin) return OMX_ErrorBadParameter;

    const OMX_ERRORTYPE result = _codec->definePort(index, wanted, ports);
    if (result != OMX_ErrorNone) return result;
    std::lock_guard<std::mutex> lock(_mutex);
    if (revision != _revision) continue;  // the stream changed the output meanwhile: ask again
    const bool loaded = _state == OMX_StateLoaded && _target == OMX_StateLoaded;
    for (OMX_U32 port = 0; port < kPortCount; ++port) {
      if (port == index || loaded || !_ports[port].enabled()) _ports[port].grant(ports[port]);
    }
    ++_revision;
    return OMX_ErrorNone;
  }
}

}  // namespace mediaserver
