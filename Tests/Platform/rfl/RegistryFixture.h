// A registry in a directory of its own.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "RFL/Registry.h"

class RegistryFixture : public testing::Test {
protected:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "zo-registry-XXXXXX").string();
        ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
        mDirectory = pattern;
        ::setenv("ZOCLIENT_CONFIG_HOME", (mDirectory + "/config").c_str(), 1);
        ::setenv("ZOCLIENT_MACHINE_CONFIG", (mDirectory + "/machine/registry.sqlite").c_str(), 1);
        RFL::SetRegistryTimeLimit(std::chrono::seconds(20));
    }
    void TearDown() override {
        RFL::CloseRegistry();
        RFL::SetRegistryTimeLimit(std::chrono::seconds(5));
        std::filesystem::remove_all(mDirectory);
    }

    std::string File() const { return mDirectory + "/config/registry.sqlite"; }
    static mode_t ModeOf(const std::string& inPath) {
        struct stat status {};
        return ::lstat(inPath.c_str(), &status) == 0 ? status.st_mode & 07777 : 0;
    }
    static std::string BytesOf(const std::string& inPath) {
        std::ifstream stream(inPath, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(stream), {});
    }
    void WriteFile(const std::string& inBytes) const {
        std::filesystem::create_directories(mDirectory + "/config");
        std::ofstream(File(), std::ios::binary) << inBytes;
    }
    /// The answer of SQLite itself to one statement over a file.
    static std::string Ask(const std::string& inFile, const char* inSQL) {
        sqlite3* database = nullptr;
        std::string answer;
        const auto take = [](void* outAnswer, int inCount, char** inValues, char**) {
            for (int column = 0; column < inCount; ++column) {
                static_cast<std::string*>(outAnswer)->append(inValues[column] ? inValues[column] : "NULL");
            }
            return 0;
        };
        if (sqlite3_open(inFile.c_str(), &database) != SQLITE_OK ||
            sqlite3_exec(database, inSQL, take, &answer, nullptr) != SQLITE_OK) {
            answer = sqlite3_errmsg(database);
        }
        sqlite3_close(database);
        return answer;
    }
    static RFL::RegistryKey MakeKey(const ostcore::UString& inPath) {
        RFL::RegistryKey key;
        EXPECT_EQ(RFL::RegistryKey::Create(RFL::RegistryRoot::User, inPath, key), 0);
        return key;
    }

    std::string mDirectory;
};
