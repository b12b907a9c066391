// Marks what the platform library shows outside; everything else stays hidden.
#pragma once

#if defined(_WIN32)
#define ZOPLATFORM_EXPORT __declspec(dllexport)
#else
#define ZOPLATFORM_EXPORT __attribute__((visibility("default")))
#endif
