// The class that the test in-process server offers, shared by the server and
// the tests that load it through the registry.
#pragma once
#include "tav/platform.h"

// {6B1F3C2A-8E4D-4A7B-9C15-2D3E4F5A6B7C}
inline const CLSID CLSID_TavTestCounter = {0x6b1f3c2a, 0x8e4d, 0x4a7b, {0x9c, 0x15, 0x2d, 0x3e, 0x4f, 0x5a, 0x6b, 0x7c}};

struct ITavTestCounter : public IUnknown {
    virtual LONG STDMETHODCALLTYPE Increment() = 0;
};
__CRT_UUID_DECL(ITavTestCounter, 0x6b1f3c2b, 0x8e4d, 0x4a7b, 0x9c, 0x15, 0x2d, 0x3e, 0x4f, 0x5a, 0x6b, 0x7c)
