// Stands in for the Windows header of the same name on other platforms.
#pragma once
#include "tav/platform.h"
