// Marks what the client library shows outside; everything else stays hidden.
#pragma once

#if defined(_WIN32)
#define ZOCL_EXPORT __declspec(dllexport)
#else
#define ZOCL_EXPORT __attribute__((visibility("default")))
#endif
