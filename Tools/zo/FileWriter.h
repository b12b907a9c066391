// Writes fetched payloads to files that appear whole or not at all, and never over a file by accident.
#pragma once

#include <string>
#include <string_view>

namespace zo {

enum class Overwrite { Never, Replace };

/// Throws a Failure when a file of this name exists and must not be replaced.
void CheckMayWrite(const std::string& inPath, Overwrite inOverwrite);

/// Writes aside in the same directory, syncs, and gives the file its name as the last step. Without Replace
/// a file that has come to exist meanwhile is left alone and a Failure thrown.
void WriteFileWhole(const std::string& inPath, std::string_view inBytes, Overwrite inOverwrite);

/// Makes a directory and its parents with the usual mode.
void MakeDirectory(const std::string& inPath);

}  // namespace zo
