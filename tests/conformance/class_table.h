// The seventeen classes as a client sees them: names, ProgIDs, descriptions,
// and which interfaces QueryInterface answers and the type library declares.
// Written down from the published table, independently of the module's own.
#pragma once
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace tav::conformance {

inline constexpr int kClassCount = 17;

// "TavController" for version 1, "TavController<n>" for the others.
std::wstring ClassName(int version);
std::wstring VersionedProgId(int version);
std::wstring ProgId(int version);
std::wstring Description(int version);
// The version-independent ProgID's description; the third class's says
// "TavController2 Class".
std::wstring ProgIdDescription(int version);

// The class version from which on QueryInterface answers `name`; 0 for an
// interface that no class answers.
int AnsweredSince(std::wstring_view name);
bool Answers(int version, std::wstring_view name);
// Every interface that some class answers, in the order of the table.
std::vector<std::wstring_view> AnsweredInterfaces();
// The published counts, IUnknown not included.
int AnsweredCount(int version);
int DeclaredCount(int version);

// Interfaces that extend one another and so share one pointer.
std::span<const std::vector<std::wstring_view>> Families();

inline constexpr std::wstring_view kObjectEvents = L"_ITavObjectEvents";
inline constexpr std::wstring_view kIpcMessages = L"_ITavIPCMessages";
inline constexpr int kIpcMessagesSince = 8;

}  // namespace tav::conformance
