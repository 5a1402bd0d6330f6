// The one translation unit that defines the GUIDs of the generated headers.
#include <initguid.h>

#include "TavController.h"
#include "TavSiblings.h"
