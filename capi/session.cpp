// The functions that hand a call on to the session: one operation each.
#include "capi/handle.h"
#include "decoder/omx_interface_decoder.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/omxbridge.h"

int omx_interface_init(void* handle) {
  return forward(handle, &OmxInterface::init);
}

int omx_interface_deinit(void* handle) {
  return forward(handle, &OmxInterface::deInit);
}

int omx_interface_error(void* handle) {
  return forward(handle, &OmxInterface::threadError);
}

int omx_interface_register_input_callback(void* handle, OmxInputCallback callback, void* context) {
  if (handle == nullptr) return OMXI_ERR_CREATE_INTERFACE;
  fromHandle<OmxInterface>(handle)->registerInputCallback(callback, context);
  return OMXI_OK;
}

int omx_interface_register_output_callback(void* handle, OmxOutputCallback callback, void* context) {
  if (handle == nullptr) return OMXI_ERR_CREATE_INTERFACE;
  fromHandle<OmxInterface>(handle)->registerOutputCallback(callback, context);
  return OMXI_OK;
}

int omx_interface_reserve_input_buffer(void* handle, void** buffer, void** data) {
  return forward(handle, &OmxInterface::reserveInputBuffer, buffer, data);
}

int omx_interface_send_input_buffer(void* handle, void* buffer, int length, int timestamp) {
  return forward(handle, &OmxInterface::sendInputBuffer, buffer, length, timestamp);
}

int omx_interface_send_final_buffer(void* handle, void* buffer, int timestamp) {
  return forward(handle, &OmxInterface::sendFinalBuffer, buffer, timestamp);
}

int omx_interface_send_input_data(void* handle, void* data, unsigned int length, int timestamp) {
  return forward(handle, &OmxInterface::sendInputData, data, length, timestamp);
}

int omx_interface_send_end_of_input_flag(void* handle, int timestamp) {
  return forward(handle, &OmxInterface::sendEndOfInputFlag, timestamp);
}

int omx_send_data_frame_to_encoder(void* handle, const unsigned char* frame, int width, int height,
                                   int timestamp) {
  return forward(handle, &OmxInterfaceEncoder::sendDataFrame, frame, width, height, timestamp);
}

int omx_interface_set_config(void* handle, CONFIGTYPE type, unsigned long value) {
  return forward(handle, &OmxInterfaceEncoder::setConfig, type, value);
}

int omx_interface_get_buffer_number(void* handle) {
  return forward(handle, &OmxInterfaceDecoder::getBufferNum);
}

int omx_decoder_set_input_compression_format(void* handle, int format) {
  return forward(handle, &OmxInterfaceDecoder::setInputCompressionFormat, format);
}

int omx_decoder_set_input_packing_format(void* handle, int format) {
  return forward(handle, &OmxInterfaceDecoder::setInputPackingFormat, format);
}
