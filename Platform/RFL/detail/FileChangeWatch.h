// Waits for changes of the files in one directory, made by whatever process.
#pragma once

#include <chrono>
#include <memory>
#include <string>

namespace RFL {

/// One thread waits; any other may wake it.
class FileChangeWatch {
public:
    /// Null when the directory cannot be watched.
    static std::unique_ptr<FileChangeWatch> Create(const std::string& inDirectory);
    virtual ~FileChangeWatch() = default;

    enum class Event { Changed, Woken, TimedOut };
    /// Events that came since the last wait count. Changes that follow each other closely are told once.
    virtual Event Wait(std::chrono::milliseconds inTimeout) = 0;
    /// Ends the present or the next wait.
    virtual void Wake() = 0;
};

}  // namespace RFL
