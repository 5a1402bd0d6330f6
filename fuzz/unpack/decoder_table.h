#pragma once
// Every Unpack operation of the controller object, reached through the
// interface a client would use. The first input byte of the decoder target
// picks the row, so rows are only ever appended.
#include <span>

#include "TavController.h"
#include "robustness/support/out_values.h"

namespace tav::fuzz {

struct DecoderRow {
    const char* name;
    // The command whose reply the decoder reads, for seeds recorded from the
    // virtual controller; nullptr where the text comes with an event.
    const char* verb;
    const char* command;
    const char* args;
    // A reply written from the decoder's grammar, the seed where the virtual
    // controller gives none.
    const char* example;
    HRESULT (*decode)(VARIANT* data, robustness::OutValues& out);
    unsigned quirks = robustness::OutValues::kNone;
};

std::span<const DecoderRow> DecoderRows();

// The initialised controller object the rows call, made once.
IUnknown* DecodingObject();

}  // namespace tav::fuzz
