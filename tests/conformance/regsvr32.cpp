#include "regsvr32.h"

#include <vector>

namespace tav::conformance {
namespace {

class Handle {
public:
    explicit Handle(HANDLE handle) noexcept : handle_(handle) {}
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;
    ~Handle() {
        if (handle_ != nullptr) CloseHandle(handle_);
    }
    HANDLE Get() const noexcept { return handle_; }

private:
    HANDLE handle_;
};

// Sets (or, for a null value, removes) an environment variable of this
// process, which the child inherits, for as long as it lives.
class ScopedEnvironment {
public:
    ScopedEnvironment(const wchar_t* name, const wchar_t* value) : name_(name) {
        SetEnvironmentVariableW(name_, value);
    }
    ScopedEnvironment(const ScopedEnvironment&) = delete;
    ScopedEnvironment& operator=(const ScopedEnvironment&) = delete;
    ~ScopedEnvironment() { SetEnvironmentVariableW(name_, nullptr); }

private:
    const wchar_t* name_;
};

constexpr DWORD kCouldNotRun = 0xFFFF0001;
constexpr DWORD kTimeoutMs = 5 * 60 * 1000;

}  // namespace

DWORD RunRegsvr32(const std::wstring& module, RegistrationAction action, RegistrationScope scope) {
    wchar_t system[MAX_PATH] = {};
    if (GetSystemDirectoryW(system, MAX_PATH) == 0) {
        return kCouldNotRun;
    }
    const std::wstring program = std::wstring(system) + L"\\regsvr32.exe";
    std::wstring commandLine = L"\"" + program + L"\" /s ";
    if (action == RegistrationAction::Unregister) commandLine += L"/u ";
    commandLine += L"\"" + module + L"\"";
    std::vector<wchar_t> writable(commandLine.begin(), commandLine.end());
    writable.push_back(L'\0');

    const ScopedEnvironment perUser(kPerUserSwitch, scope == RegistrationScope::User ? L"1" : nullptr);
    STARTUPINFOW startup = {};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION process = {};
    if (!CreateProcessW(program.c_str(), writable.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr, &startup,
                        &process)) {
        return kCouldNotRun;
    }
    const Handle processHandle(process.hProcess);
    const Handle threadHandle(process.hThread);
    if (WaitForSingleObject(processHandle.Get(), kTimeoutMs) != WAIT_OBJECT_0) {
        TerminateProcess(processHandle.Get(), kCouldNotRun);
        return kCouldNotRun;
    }
    DWORD exitCode = kCouldNotRun;
    GetExitCodeProcess(processHandle.Get(), &exitCode);
    return exitCode;
}

}  // namespace tav::conformance
