// The records that cross to the command component keep the layout of the
// 32-bit target: a 16-byte VARIANT, and a 32-byte TavCommandReply whose
// VARIANT sits at offset 8.
#include <cstddef>
#include <cstdint>

#include "TavController.h"

#if UINTPTR_MAX == 0xFFFFFFFFu
static_assert(sizeof(VARIANT) == 16, "VARIANT is 16 bytes on a 32-bit target");
static_assert(sizeof(TavCommandReply) == 32, "TavCommandReply is 32 bytes on a 32-bit target");
static_assert(offsetof(TavCommandReply, data) == 8, "TavCommandReply.data sits at offset 8");
static_assert(offsetof(TavCommandReply, userDef) == 24, "TavCommandReply.userDef sits at offset 24");
#endif
static_assert(sizeof(LONG) == 4 && sizeof(ULONG) == 4, "the IDL's long is 32 bits everywhere");
static_assert(sizeof(OLECHAR) == 2, "OLECHAR is 16 bits everywhere");
