#include "conformance_support.h"

#include <algorithm>
#include <cstdio>
#include <thread>

#include <gtest/gtest.h>

namespace tav::conformance {
namespace {

ModulePaths& ModuleStore() {
    static ModulePaths paths;
    return paths;
}

std::vector<std::string>& CheckedStore() {
    static std::vector<std::string> lines;
    return lines;
}

std::vector<std::string>& DifferenceStore() {
    static std::vector<std::string> lines;
    return lines;
}

}  // namespace

const ModulePaths& Modules() { return ModuleStore(); }
void SetModules(ModulePaths paths) { ModuleStore() = std::move(paths); }

void Checked(const std::string& what) {
    CheckedStore().push_back((::testing::Test::HasFailure() ? "NOT MET: " : "checked: ") + what);
}

void Pending(const std::string& what) { CheckedStore().push_back("pending: " + what); }
const std::vector<std::string>& CheckedLines() { return CheckedStore(); }
const std::vector<std::string>& WineDifferences() { return DifferenceStore(); }

bool RunningOnWine() {
    const HMODULE ntdll = GetModuleHandleW(L"ntdll.dll");
    return ntdll != nullptr && GetProcAddress(ntdll, "wine_get_version") != nullptr;
}

bool NoteWineDifference(const char* reason, const char* file, int line) {
    if (!RunningOnWine()) {
        return false;
    }
    const char* name = file;
    for (const char* p = file; *p != '\0'; ++p) {
        if (*p == '/' || *p == '\\') name = p + 1;
    }
    std::string entry = std::string(name) + ":" + std::to_string(line) + ": " + reason;
    std::printf("WINE DIFFERENCE %s\n", entry.c_str());
    std::fflush(stdout);
    auto& store = DifferenceStore();
    if (std::find(store.begin(), store.end(), entry) == store.end()) {
        store.push_back(std::move(entry));
    }
    return true;
}

HRESULT RunInApartment(DWORD model, const std::function<void()>& body) {
    HRESULT entered = E_UNEXPECTED;
    std::thread thread([&] {
        entered = CoInitializeEx(nullptr, model);
        if (FAILED(entered)) {
            return;
        }
        body();
        CoUninitialize();
    });
    thread.join();
    return FAILED(entered) ? entered : S_OK;
}

const char* ApartmentName(DWORD model) {
    return model == COINIT_MULTITHREADED ? "multithreaded apartment" : "single-threaded apartment";
}

std::wstring GuidText(REFGUID guid) {
    wchar_t text[40] = {};
    StringFromGUID2(guid, text, 40);
    return text;
}

std::string Narrow(std::wstring_view text) {
    std::string narrow;
    for (wchar_t c : text) {
        narrow += c < 128 ? static_cast<char>(c) : '?';
    }
    return narrow;
}

bool SamePath(std::wstring_view a, std::wstring_view b) {
    return CompareStringOrdinal(a.data(), static_cast<int>(a.size()), b.data(), static_cast<int>(b.size()), TRUE) ==
           CSTR_EQUAL;
}

}  // namespace tav::conformance
