#pragma once
#include "TavController.h"
#include "tav/platform.h"

namespace tav {

class ControllerObject;

// The condition list of a pending change to automatic mode, in its version-2
// form. It has no interface slot: UnpackOperationMode2 hands it the text
// after "AUTO_CH". The change flag and the enumerator are required; cycle,
// when given, receives the third field of a "RunMode" element.
HRESULT UnpackAutoConditions2(ControllerObject& object, VARIANT* data, LONG* change, IEnumAutoCondition2** conditions,
                              ULONG* cycle);

}  // namespace tav
