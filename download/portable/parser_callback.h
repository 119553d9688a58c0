// The serial driver's only way to speak: messages, progress and the question whether to stop.
#pragma once

#include <cstdint>

#include "download/portable/protocol_vocabulary.h"
#include "support/portable/wide_text.h"

// The total the procedures pass with SetProgress, but Y-Modem, which passes the announced size.
constexpr uint32_t kProgressScale = 100;

// Implemented by whoever runs the driver (the download thread); called on the driver's thread.
class TParserCallBack {
public:
    virtual ~TParserCallBack() = default;
    // text is zero-terminated and lives only for the call.
    virtual void ShowMessage(MessageCode code, const WideChar* text) = 0;
    // The line protocol always passes total kProgressScale.
    virtual void SetProgress(uint32_t total, uint32_t current) = 0;
    virtual bool IsCancelled() = 0;
};
