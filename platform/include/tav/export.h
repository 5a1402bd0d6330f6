// Marks the functions that the platform library exports.
#pragma once

#ifndef TAV_PLATFORM_API
#ifdef _WIN32
#define TAV_PLATFORM_API
#else
#define TAV_PLATFORM_API __attribute__((visibility("default")))
#endif
#endif
