#include "class_table.h"

#include <array>

namespace tav::conformance {
namespace {

struct Generation {
    int since;
    std::vector<std::wstring_view> added;
};

const std::vector<Generation>& Generations() {
    static const std::vector<Generation> table = {
        {1, {L"ITavController", L"ITavBackupRestore", L"ITavLANAdaptor", L"ITavBoot", L"ITavSubscribe", L"ITavPanel",
             L"ITavUser", L"ITavUAS", L"ITavMastership", L"ITavVirtualTime", L"ITavHelperBase",
             L"ITavDynamicDevices"}},
        {2, {L"ITavController2"}},
        {3, {L"ITavFileManagement", L"ITavController3"}},
        {4, {L"ITavSystemDiagnostics"}},
        {5, {L"ITavPositionalSafetyController"}},
        {6, {L"ITavLANAdaptor2", L"ITavDorvel"}},
        {7, {L"ITavPanel2"}},
        {8, {L"ITavIPC", L"ITavIPCInformation"}},
        {9, {L"ITavDynamicDevices2"}},
        {10, {L"ITavUser2"}},
        {11, {L"ITavLumeret"}},
        {12, {L"ITavController4", L"ITavLumeret2"}},
        {13, {L"ITavControllerTime"}},
        {14, {L"ITavUser3"}},
        {15, {L"ITavSafety", L"ITavPanel3", L"ITavController5", L"ITavBoot2"}},
        {16, {L"ITavBackupRestore2", L"ITavController6", L"ITavBoot3"}},
        {17, {L"ITavPanel4"}},
    };
    return table;
}

constexpr std::array<int, kClassCount> kAnsweredCounts = {12, 13, 15, 16, 17, 19, 20, 22, 23,
                                                          24, 25, 27, 28, 29, 33, 36, 37};
constexpr std::array<int, kClassCount> kDeclaredCounts = {38, 14, 16, 17, 18, 20, 21, 24, 25,
                                                          26, 27, 29, 30, 31, 35, 38, 39};

}  // namespace

std::wstring ClassName(int version) {
    return version == 1 ? std::wstring(L"TavController") : L"TavController" + std::to_wstring(version);
}

std::wstring VersionedProgId(int version) { return ProgId(version) + L".1"; }
std::wstring ProgId(int version) { return L"TavController." + ClassName(version); }
std::wstring Description(int version) { return ClassName(version) + L" Class"; }
std::wstring ProgIdDescription(int version) { return version == 3 ? Description(2) : Description(version); }

int AnsweredSince(std::wstring_view name) {
    for (const Generation& generation : Generations()) {
        for (std::wstring_view added : generation.added) {
            if (added == name) return generation.since;
        }
    }
    return 0;
}

bool Answers(int version, std::wstring_view name) {
    const int since = AnsweredSince(name);
    return since != 0 && since <= version;
}

std::vector<std::wstring_view> AnsweredInterfaces() {
    std::vector<std::wstring_view> all;
    for (const Generation& generation : Generations()) {
        all.insert(all.end(), generation.added.begin(), generation.added.end());
    }
    return all;
}

int AnsweredCount(int version) { return kAnsweredCounts.at(version - 1); }
int DeclaredCount(int version) { return kDeclaredCounts.at(version - 1); }

std::span<const std::vector<std::wstring_view>> Families() {
    static const std::vector<std::vector<std::wstring_view>> families = {
        {L"ITavController", L"ITavController2", L"ITavController3", L"ITavController4", L"ITavController5",
         L"ITavController6"},
        {L"ITavUser", L"ITavUser2", L"ITavUser3"},
        {L"ITavPanel", L"ITavPanel2", L"ITavPanel3", L"ITavPanel4"},
        {L"ITavBoot", L"ITavBoot2", L"ITavBoot3"},
        {L"ITavBackupRestore", L"ITavBackupRestore2"},
        {L"ITavLANAdaptor", L"ITavLANAdaptor2"},
        {L"ITavDynamicDevices", L"ITavDynamicDevices2"},
        {L"ITavLumeret", L"ITavLumeret2"},
    };
    return families;
}

}  // namespace tav::conformance
