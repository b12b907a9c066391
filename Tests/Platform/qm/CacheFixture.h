// A cache in a directory of its own, payloads that can be told from each other, and operations that fail.
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <random>
#include <string>

#include "QM/DataCache.h"
#include "QM/detail/FileDataCache.h"

inline QM::ImmutableString KeyOf(int inNumber) {
    return QM::ImmutableString("content-" + std::to_string(inNumber));
}

/// Between a hundred bytes and a third of a megabyte, the same for the same number. Cheap, so that a process
/// that writes them spends its time on writing.
inline QM::Payload PayloadOf(int inNumber) {
    static const std::string sNoise = [] {
        std::mt19937 random(7919);
        std::string noise(310000, '\0');
        std::generate(noise.begin(), noise.end(), [&] { return static_cast<char>(random()); });
        return noise;
    }();
    const auto number = static_cast<std::size_t>(inNumber);
    const std::size_t size = number % 8 == 0 ? 300000 : 100 + number * 631 % 8000;
    const auto payload = QM::RecycledMemory::CreateFromBytes({sNoise.data() + number % 10000, size});
    std::memcpy(payload->data(), &inNumber, sizeof inNumber);
    return payload;
}

class CacheFixture : public testing::Test {
protected:
    CacheFixture() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zo-cache-XXXXXX").string();
        mDirectory = mkdtemp(pattern.data());
        mPath = mDirectory + "/content";
    }
    ~CacheFixture() override {
        Close();
        std::filesystem::remove_all(mDirectory);
    }

    /// As another run of the program would find it.
    void Open(const QM::shared_ptr<QM::detail::FileOperations>& inOperations =
                  boost::make_shared<QM::detail::FileOperations>()) {
        Close();
        std::string error;
        const auto directory = QM::detail::CacheDirectory::Open(mPath, true, inOperations, error);
        ASSERT_TRUE(directory) << error;
        cache = QM::detail::FileDataCache::Create(directory);
    }
    void Close() {
        if (cache) {
            cache->Close(60000);
            cache.reset();
        }
    }

    bool Write(int inNumber) { return Write(KeyOf(inNumber), PayloadOf(inNumber)); }
    bool Write(const QM::ImmutableString& inKey, const QM::Payload& inPayload) {
        return cache->Write(inKey, kName, inPayload) && cache->WaitForWrites(60000);
    }
    /// Null when there is nothing; the test fails when the completion does not come once.
    QM::Payload Read(const QM::ImmutableString& inKey, QM::DataCache* inCache = nullptr) {
        struct State {
            std::mutex mutex;
            std::condition_variable changed;
            int calls = 0;
            QM::Payload payload;
        };
        const auto state = std::make_shared<State>();
        QM::Payload atOnce;
        const int result = (inCache ? inCache : cache.get())
                               ->Read(
                                   inKey, kName,
                                   [state](int inResult, const QM::Payload& inPayload) {
                                       EXPECT_EQ(inResult == 0, inPayload != nullptr);
                                       std::lock_guard<std::mutex> lock(state->mutex);
                                       ++state->calls;
                                       state->payload = inPayload;
                                       state->changed.notify_all();
                                   },
                                   atOnce);
        if (result != QM::kResultContentPending) {
            EXPECT_EQ(result == QM::kResultContentAvailable, atOnce != nullptr);
            return atOnce;
        }
        std::unique_lock<std::mutex> lock(state->mutex);
        EXPECT_TRUE(
            state->changed.wait_for(lock, std::chrono::seconds(60), [&] { return state->calls > 0; }));
        EXPECT_EQ(state->calls, 1);
        return state->payload;
    }
    /// There, and what was written.
    bool Has(int inNumber) {
        const QM::Payload payload = Read(KeyOf(inNumber));
        if (payload) {
            EXPECT_TRUE(payload->view() == PayloadOf(inNumber)->view()) << "wrong bytes for " << inNumber;
        }
        return payload != nullptr;
    }

    std::vector<std::string> Files() const {
        std::vector<std::string> files;
        for (const auto& entry : std::filesystem::recursive_directory_iterator(mPath)) {
            if (!entry.is_directory()) {
                files.push_back(entry.path().string());
            }
        }
        return files;
    }
    std::string FileOf(int inNumber) const {
        QM::detail::EntryKey key;
        EXPECT_TRUE(QM::detail::MakeEntryKey(KeyOf(inNumber), kName, key));
        return mPath + "/" + QM::detail::DirectoryNameOf(key) + "/" + QM::detail::FileNameOf(key);
    }
    /// Left by a write that did not come to its end; nobody reads it, and it goes after an hour.
    static bool IsAside(const std::string& inFile) {
        return std::filesystem::path(inFile).filename().string().rfind(".new-", 0) == 0;
    }
    std::size_t CountReadableFiles() const {
        const std::vector<std::string> files = Files();
        return static_cast<std::size_t>(
            std::count_if(files.begin(), files.end(), [](const auto& inFile) { return !IsAside(inFile); }));
    }
    static mode_t ModeOf(const std::string& inPath) {
        struct stat status {};
        return lstat(inPath.c_str(), &status) == 0 ? status.st_mode & 07777 : 0;
    }
    static std::string BytesOf(const std::string& inPath) {
        std::ifstream stream(inPath, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(stream), {});
    }
    static void SetBytes(const std::string& inPath, const std::string& inBytes) {
        std::ofstream(inPath, std::ios::binary | std::ios::trunc) << inBytes;
    }

    const QM::ImmutableString kName{"gz"};
    std::string mDirectory;
    std::string mPath;
    QM::shared_ptr<QM::detail::FileDataCache> cache;
};
