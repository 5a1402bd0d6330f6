// Resource identifiers of the module, shared by the resource script and code.
#pragma once

#define IDS_PROJNAME 100
#define IDR_TAVCONTROLLER 101
