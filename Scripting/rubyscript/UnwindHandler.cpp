// SPDX-License-Identifier: MIT
#include "UnwindHandler.h"

UnwindHandler::UnwindHandler(void (*callback)(void*), void* callbackContext)
    : record{static_cast<HandlerRecord*>(ChainHead()), Handle},
      discarded(callback),
      context(callbackContext) {
  SetChainHead(&record);
}

UnwindHandler::~UnwindHandler() { SetChainHead(record.next); }

EXCEPTION_DISPOSITION UnwindHandler::Handle(EXCEPTION_RECORD* exception, void* frame, CONTEXT*,
                                            void*) {
  if (exception->ExceptionFlags & kUnwindingFlags) {
    UnwindHandler& handler = *static_cast<UnwindHandler*>(frame);
    handler.discarded(handler.context);
  }
  return ExceptionContinueSearch;
}
