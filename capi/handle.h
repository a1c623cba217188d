// Handles of the C interface: a session as an untyped pointer. All handles are pointers to the base
// class, so that any function can take any session's handle back.
#pragma once

#include "core/omx_interface.h"

inline void* toHandle(OmxInterface* session) {
  return session;
}

// The session behind a handle, as the class that the function is about: the handle's kind is not checked.
template <typename Session>
Session* fromHandle(void* handle) {
  return static_cast<Session*>(static_cast<OmxInterface*>(handle));
}

// Calls an operation of the session behind `handle`; a null handle gives 2 instead.
template <typename Session, typename Operation, typename... Arguments>
int forward(void* handle, Operation Session::*operation, Arguments... arguments) {
  if (handle == nullptr) return OMXI_ERR_CREATE_INTERFACE;
  return (fromHandle<Session>(handle)->*operation)(arguments...);
}
