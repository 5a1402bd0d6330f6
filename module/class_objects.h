#pragma once
#include "module/class_table.h"
#include "tav/platform.h"

namespace tav {

// The row's class object, created on first use, queried for riid.
HRESULT GetClassObject(ClassRow& row, REFIID riid, void** object);

// Drops the module's references to the cached class objects; the next
// GetClassObject makes new ones. Runs at process detach (and at unload where
// there is no DllMain); must not race with GetClassObject.
void ReleaseClassObjects();

// Makes every class creatable through CoCreateInstance in this process
// without a registry entry (hosts that link the module statically), and
// takes the registrations back. Both are called from one thread at a time.
HRESULT RegisterClassObjects(DWORD context, DWORD flags);
void RevokeClassObjects();

}  // namespace tav
