// Every Unpack operation with hostile replies. The first byte picks the
// decoder (its low seven bits) and whether the reply is a text at all (its top
// bit); the rest is the reply text, one character per byte, except that 0xFF
// and the two bytes after it make one 16-bit character.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include "fuzz_text.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "unpack/decoder_table.h"

namespace tav::fuzz {
namespace {

// What a callback may hand a client instead of a reply text.
void OtherVariant(const std::uint8_t* data, std::size_t size, VARIANT& reply, BSTR& byReference) {
    switch (size % 5) {
        case 0:
            break;  // VT_EMPTY
        case 1: {
            reply.vt = VT_I4;
            std::int32_t value = 0;
            std::memcpy(&value, data, size < sizeof(value) ? size : sizeof(value));
            reply.lVal = value;
            break;
        }
        case 2:
            reply.vt = VT_BSTR;
            reply.bstrVal = nullptr;
            break;
        case 3:
            reply.vt = VT_BSTR | VT_BYREF;
            reply.pbstrVal = &byReference;
            break;
        default:
            reply.vt = VT_NULL;
            break;
    }
}

bool EndsWithSuffix(OleStringView text) {
    // "...TavControllerImpl[<line>]; "
    const OleStringView source = OLESTR("TavControllerImpl[");
    if (text.size() < source.size() + 4 || text.substr(text.size() - 3) != OLESTR("]; ")) return false;
    const std::size_t open = text.rfind(source);
    if (open == OleStringView::npos) return false;
    const OleStringView line = text.substr(open + source.size(), text.size() - 3 - open - source.size());
    if (line.empty()) return false;
    for (const OLECHAR c : line) {
        if (c < OLECHAR('0') || c > OLECHAR('9')) return false;
    }
    return true;
}

void CheckErrorText(const DecoderRow& row, HRESULT hr) {
    if (hr == E_NOTIMPL) return;  // a decoder that the user component does not provide
    if (hr != E_FAIL && hr != E_OUTOFMEMORY && hr != E_INVALIDARG) {
        std::fprintf(stderr, "%s failed with 0x%08X, not a decoder's code\n", row.name, static_cast<unsigned>(hr));
        std::abort();
    }
    ComPtr<ITavHelperBase> helper;
    if (FAILED(QueryTo(DecodingObject(), helper))) std::abort();
    Bstr text;
    if (FAILED(helper->GetLastErrorInfo(text.Receive())) || !EndsWithSuffix(text.View())) {
        std::fprintf(stderr, "%s failed without an error text that names its site\n", row.name);
        std::abort();
    }
}

}  // namespace
}  // namespace tav::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace tav::fuzz;
    if (size == 0) return 0;
    const auto rows = DecoderRows();
    const DecoderRow& row = rows[(data[0] & 0x7F) % rows.size()];
    const bool text = (data[0] & 0x80) == 0;
    ++data;
    --size;

    VARIANT reply;
    VariantInit(&reply);
    BSTR byReference = nullptr;
    if (text) {
        const auto chars = OleTextOf(data, size);
        reply.vt = VT_BSTR;
        // Exactly as long as the text, so that a read past it is seen.
        reply.bstrVal = SysAllocStringLen(chars.data(), static_cast<UINT>(chars.size()));
        if (reply.bstrVal == nullptr) std::abort();
    } else {
        OtherVariant(data, size, reply, byReference);
    }
    const bool nullText = reply.vt == VT_BSTR && reply.bstrVal == nullptr;

    tav::robustness::OutValues out(nullText, row.quirks);
    const HRESULT hr = row.decode(&reply, out);
    const std::string fault = out.Check(hr);
    if (!fault.empty()) {
        std::fprintf(stderr, "%s returned 0x%08X and %s\n", row.name, static_cast<unsigned>(hr), fault.c_str());
        std::abort();
    }
    if (FAILED(hr)) CheckErrorText(row, hr);
    if (reply.vt == (VT_BSTR | VT_BYREF) && byReference != nullptr) std::abort();  // nothing may write through it
    VariantClear(&reply);
    return 0;
}
