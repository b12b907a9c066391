// What another process does with a cache directory.
#pragma once

constexpr const char* kCacheWorkerFlag = "--cache-worker";

/// Arguments: the directory, the bound on the count of files, the number of the first payload, how many (0:
/// without end), and the factor that makes a payload of a number. Writes them one after the other and tells
/// the number of every eighth once it and those before it are written.
int RunCacheWorker(int inCount, char** inArguments);
