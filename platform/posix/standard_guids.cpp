// Defines the GUIDs that com_types.h declares.
#define INITGUID
#include "tav/com_types.h"
