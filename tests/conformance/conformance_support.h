// What every step of the conformance run shares: the modules under test, the
// printed summary, Wine detection and COM apartments on threads of their own.
#pragma once
#include <functional>
#include <string>
#include <vector>

#include "tav/platform.h"

namespace tav::conformance {

// Full Windows paths of the modules under test, from the command line. The
// virtual controller's path is empty when it was not built.
struct ModulePaths {
    std::wstring controller;
    std::wstring sim;
};
const ModulePaths& Modules();
void SetModules(ModulePaths paths);

// One line of the summary printed at the end of the run: what the current
// test checked (marked when the test has failed so far), or what it could
// not check in this build.
void Checked(const std::string& what);
void Pending(const std::string& what);
const std::vector<std::string>& CheckedLines();
const std::vector<std::string>& WineDifferences();

bool RunningOnWine();

// Marks a check that accepts Wine's behaviour where Windows behaves otherwise.
// Logs the reason and returns true under Wine; returns false on Windows, where
// the check keeps its Windows expectation.
bool NoteWineDifference(const char* reason, const char* file, int line);
#define TAV_WINE_DIFFERENCE(reason) ::tav::conformance::NoteWineDifference(reason, __FILE__, __LINE__)

// Runs `body` on a new thread that has entered a COM apartment of the given
// model (COINIT_MULTITHREADED or COINIT_APARTMENTTHREADED) and leaves it
// afterwards; returns CoInitializeEx's failure, if any.
HRESULT RunInApartment(DWORD model, const std::function<void()>& body);
const char* ApartmentName(DWORD model);

// The registry form of a GUID, "{...}".
std::wstring GuidText(REFGUID guid);
std::string Narrow(std::wstring_view text);

// Windows paths compare without regard to case.
bool SamePath(std::wstring_view a, std::wstring_view b);

}  // namespace tav::conformance
