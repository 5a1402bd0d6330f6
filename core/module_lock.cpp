#include "core/module_lock.h"

namespace tav {
namespace {
LONG volatile lockCount = 0;
}

void ModuleLock::Add() { InterlockedIncrement(&lockCount); }
void ModuleLock::Remove() { InterlockedDecrement(&lockCount); }
LONG ModuleLock::Count() { return InterlockedCompareExchange(&lockCount, 0, 0); }

}  // namespace tav
