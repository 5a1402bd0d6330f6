// Who made, validated and locked the safety configuration, and its checksum.
//
// The reply is a sequence of tab-ended "-key value" fields: a fixed head of
// version and lock numbers, the lock's date and author when locked, then the
// other fields found by their keys, each searched after the previous one,
// and the checksum as 64 hexadecimal digits.
#include <optional>

#include "core/controller_object.h"
#include "core/keyed_text.h"

namespace tav {
namespace {

// A keyed text value, kept only when shorter than its limit; a longer one
// gives an empty field, not a failure. A missing key and a missing closing
// tab are two failures, each reported from its own line of the table.
struct TextField {
    const OLECHAR* key;
    std::size_t limit;
    BSTR* (*field)(TavVantorConfigInfo& info);
    const OLECHAR* noKeyText;
    ErrorSite noKey;
    const OLECHAR* noTabText;
    ErrorSite noTab;
};

// Clients know "no vby." also for a creation date without its tab.
constexpr TextField kTextFields[] = {
    {OLESTR("-vdate"), 40, [](TavVantorConfigInfo& i) { return &i.validationInfo.validationDate; },
     OLESTR("UnpackSafetyConfigurationInfo failed no vdate."), ErrorSite::Here(),
     OLESTR("UnpackSafetyConfigurationInfo failed no vdate."), ErrorSite::Here()},
    {OLESTR("-vby"), 65, [](TavVantorConfigInfo& i) { return &i.validationInfo.validatedBy; },
     OLESTR("UnpackSafetyConfigurationInfo failed no vby."), ErrorSite::Here(),
     OLESTR("UnpackSafetyConfigurationInfo failed no vby."), ErrorSite::Here()},
    {OLESTR("-crdate"), 40, [](TavVantorConfigInfo& i) { return &i.creationInfo.creationDate; },
     OLESTR("UnpackSafetyConfigurationInfo failed no crdate."), ErrorSite::Here(),
     OLESTR("UnpackSafetyConfigurationInfo failed no vby."), ErrorSite::Here()},
    {OLESTR("-crby"), 65, [](TavVantorConfigInfo& i) { return &i.creationInfo.createdBy; },
     OLESTR("UnpackSafetyConfigurationInfo failed no crby."), ErrorSite::Here(),
     OLESTR("UnpackSafetyConfigurationInfo failed no crby."), ErrorSite::Here()},
    {OLESTR("-cnfnm"), 65, [](TavVantorConfigInfo& i) { return &i.creationInfo.configurationName; },
     OLESTR("UnpackSafetyConfigurationInfo failed no cnfname."), ErrorSite::Here(),
     OLESTR("UnpackSafetyConfigurationInfo failed no cnfname."), ErrorSite::Here()},
};

constexpr std::size_t kChecksumDigits = 64;

std::optional<unsigned> HexDigit(OLECHAR c) {
    if (c >= u'0' && c <= u'9') {
        return static_cast<unsigned>(c - u'0');
    }
    if (c >= u'a' && c <= u'f') {
        return static_cast<unsigned>(c - u'a' + 10);
    }
    if (c >= u'A' && c <= u'F') {
        return static_cast<unsigned>(c - u'A' + 10);
    }
    return std::nullopt;
}

// 64 hexadecimal digits into 32 bytes, the first digit the high half of the
// first byte; false for anything shorter or not hexadecimal.
bool DecodeChecksum(OleStringView digits, TavVantorChecksum& checksum) {
    if (digits.size() != kChecksumDigits) {
        return false;
    }
    for (std::size_t i = 0; i < kChecksumDigits; i += 2) {
        const std::optional<unsigned> high = HexDigit(digits[i]);
        const std::optional<unsigned> low = HexDigit(digits[i + 1]);
        if (!high || !low) {
            return false;
        }
        checksum.csum[i / 2] = static_cast<byte>(*high << 4 | *low);
    }
    return true;
}

HRESULT DecodeConfigurationInfo(Reply& reply, TavVantorConfigInfo& info) {
    KeyedText text(reply.Text());
    LONG lock = 0;
    std::int32_t consumed = 0;
    if (text::Scan<OLESTR("-minv %d\t-majv %d\t-islocked %d\t%n")>(text.Rest(), &info.configVersion.minorVersion,
                                                                   &info.configVersion.majorVersion, &lock,
                                                                   &consumed) != 3) {
        return reply.Fail(E_FAIL, OLESTR("UnpackSafetyConfigurationInfo failed."));
    }
    text.Skip(static_cast<std::size_t>(consumed));
    info.lockInfo.isLocked = lock > 0 ? 1 : 0;

    // The lock's fields are there only when it is locked, and given empty otherwise.
    OLECHAR lockDate[65] = {};
    OLECHAR lockedBy[65] = {};
    if (info.lockInfo.isLocked != 0) {
        consumed = 0;
        text::Scan<OLESTR("-lockdt %64[^\t]\t-lockby %64[^\t]\t%n")>(text.Rest(), lockDate, lockedBy, &consumed);
        text.Skip(static_cast<std::size_t>(consumed));
    }
    if (FAILED(reply.Allocate(OleStringView(lockDate), &info.lockInfo.lockDate)) ||
        FAILED(reply.Allocate(OleStringView(lockedBy), &info.lockInfo.lockedBy))) {
        return reply.Result();
    }

    if (!text.At(OLESTR("-valid"))) {
        return reply.Fail(E_FAIL, OLESTR("UnpackSafetyConfigurationInfo failed no vdate."));
    }
    LONG validated = 0;
    consumed = 0;
    text::Scan<OLESTR("-valid %d\t%n")>(text.Rest(), &validated, &consumed);
    text.Skip(static_cast<std::size_t>(consumed));
    info.validationInfo.isValidated = validated > 0 ? 1 : 0;

    for (const TextField& field : kTextFields) {
        if (!text.After(ViewOf(field.key))) {
            return reply.Fail(E_FAIL, ViewOf(field.noKeyText), field.noKey);
        }
        const std::optional<OleStringView> value = text.UpToTab();
        if (!value) {
            return reply.Fail(E_FAIL, ViewOf(field.noTabText), field.noTab);
        }
        const OleStringView kept = value->size() < field.limit ? *value : OleStringView();
        if (FAILED(reply.Allocate(kept, field.field(info)))) {
            return reply.Result();
        }
    }

    if (!text.After(OLESTR("-csum"))) {
        return reply.Fail(E_FAIL, OLESTR("UnpackSafetyConfigurationInfo failed no csum."));
    }
    // The separating blank is skipped; a tab ends the digits early.
    text.Skip(1);
    OleStringView digits = text.Rest().substr(0, kChecksumDigits);
    digits = digits.substr(0, digits.find(OLECHAR(u'\t')));
    if (!DecodeChecksum(digits, info.checksum)) {
        return reply.Fail(E_FAIL, OLESTR("UnpackSafetyConfigurationInfo csum failed."));
    }
    return S_OK;
}

}  // namespace

HRESULT ControllerObject::GetSafetyConfigurationInfo(TavInParams* rip, TavVantorConfigInfo* info) {
    return Command(rip)
        .ValidParams(OLESTR("GetSafetyConfigurationInfo - Invalid argument."))
        .OutPointer(info, OLESTR("GetSafetyConfigurationInfo - Invalid out-parameter."))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Get(OLESTR("SafetyConf"))
        .Decode([&](VARIANT* reply) { return UnpackSafetyConfigurationInfo(reply, info); });
}

HRESULT ControllerObject::UnpackSafetyConfigurationInfo(VARIANT* data, TavVantorConfigInfo* info) {
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackSafetyConfigurationInfo. NULL data-variant"))
        .OutPointers(OLESTR("UnpackSafetyConfigurationInfo. Invalid out pointer"), info)
        .IsBstr(OLESTR("UnpackSafetyConfigurationInfo. Invalid argument."))
        .Then([&](Reply& reply) { return DecodeConfigurationInfo(reply, *info); });
}

}  // namespace tav
