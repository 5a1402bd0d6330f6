#pragma once
#include "TavController.h"
#include "tavctl/output.h"

namespace tavctl {

// A TavLoginInfo whose strings are freed with it (and before it is filled
// again).
class LoginInfo {
public:
    LoginInfo() = default;
    LoginInfo(const LoginInfo&) = delete;
    LoginInfo& operator=(const LoginInfo&) = delete;
    ~LoginInfo() { Clear(); }

    TavLoginInfo* Out() {
        Clear();
        return &info_;
    }
    // alias, location and application appended to a record.
    void AppendTo(Record& record) const {
        record.emplace_back("alias", TextValue(info_.userAlias));
        record.emplace_back("location", TextValue(info_.location));
        record.emplace_back("application", TextValue(info_.application));
    }

private:
    void Clear() {
        SysFreeString(info_.userAlias);
        SysFreeString(info_.location);
        SysFreeString(info_.application);
        info_ = TavLoginInfo{};
    }

    TavLoginInfo info_{};
};

}  // namespace tavctl
