// Caches in memory, in files and in a row: what is kept, for how long, and in which order it goes.
#include "CacheFixture.h"

#include <thread>

namespace {

using namespace QM;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::SizeIs;
using testing::UnorderedElementsAre;

class MemoryCache : public CacheFixture {};
class FileCache : public CacheFixture {};
class CacheChain : public CacheFixture {};

Payload Block(std::size_t inSize, char inByte = 'x') {
    return RecycledMemory::CreateFromBytes(std::string(inSize, inByte));
}

TEST_F(MemoryCache, LetsTheLeastRecentlyUsedGoWhenItsBytesAreUsedUp) {
    const auto memory = CreateDataCacheInMemory(1000);
    for (int number = 0; number < 5; ++number) {
        EXPECT_TRUE(memory->Write(KeyOf(number), kName, Block(200)));
    }
    EXPECT_TRUE(Read(KeyOf(0), memory.get()));
    EXPECT_TRUE(memory->Write(KeyOf(5), kName, Block(250)));
    EXPECT_TRUE(memory->Contains(KeyOf(0), kName));
    EXPECT_FALSE(memory->Contains(KeyOf(1), kName));
    EXPECT_FALSE(memory->Contains(KeyOf(2), kName));
    EXPECT_TRUE(memory->Contains(KeyOf(3), kName));

    EXPECT_FALSE(memory->Write(KeyOf(6), kName, Block(251))) << "one payload would push out too many";
    EXPECT_TRUE(memory->Write(KeyOf(0), ImmutableString("raw"), Block(10)));
    EXPECT_THAT(memory->ListNames(KeyOf(0)), ElementsAre(kName, ImmutableString("raw")));
    memory->Remove(KeyOf(0), kName);
    EXPECT_THAT(memory->ListNames(KeyOf(0)), ElementsAre(ImmutableString("raw")));
    memory->Close(0);
    EXPECT_THAT(memory->ListNames(KeyOf(3)), IsEmpty());
    EXPECT_FALSE(memory->Write(KeyOf(3), kName, Block(1)));
}

TEST_F(FileCache, KeepsPayloadsFromRunToRun) {
    Open();
    EXPECT_THAT(cache->ListNames(KeyOf(1)), IsEmpty());
    EXPECT_FALSE(Read(KeyOf(1)));
    for (int number = 1; number <= 20; ++number) {
        EXPECT_TRUE(Write(number));
    }
    EXPECT_TRUE(Write(KeyOf(21), Block(0)));
    EXPECT_TRUE(cache->Write(KeyOf(1), ImmutableString("raw"), Block(5)));
    Open();
    EXPECT_THAT(cache->ListNames(KeyOf(1)), UnorderedElementsAre(kName, ImmutableString("raw")))
        << "before anybody has looked at the whole directory";
    for (int number = 1; number <= 20; ++number) {
        EXPECT_TRUE(Has(number));
        EXPECT_TRUE(cache->Contains(KeyOf(number), kName));
    }
    EXPECT_EQ(Read(KeyOf(21))->size(), 0u);
    EXPECT_TRUE(Write(22)) << "which looks";
    EXPECT_EQ(cache->GetFileCount(), 23u);
    EXPECT_THAT(cache->ListNames(KeyOf(1)), UnorderedElementsAre(kName, ImmutableString("raw")));
    cache->Remove(KeyOf(2), kName);
    EXPECT_FALSE(cache->Contains(KeyOf(2), kName));
    EXPECT_THAT(cache->ListNames(KeyOf(2)), IsEmpty());
}

TEST_F(FileCache, IsPrivateAndNamesNoFileAfterWhatAServerSays) {
    const mode_t mask = umask(0);
    std::filesystem::create_directory(mPath);
    chmod(mPath.c_str(), 0755);
    Open();
    const std::string hostile = "../../../etc/passwd";
    EXPECT_TRUE(Write(ImmutableString(hostile), Block(10)));
    EXPECT_TRUE(Read(ImmutableString(hostile)));
    umask(mask);
    EXPECT_EQ(ModeOf(mPath), 0700u);
    ASSERT_THAT(Files(), SizeIs(1));
    const std::string file = Files().front();
    EXPECT_EQ(ModeOf(file), 0600u);
    EXPECT_EQ(ModeOf(std::filesystem::path(file).parent_path().string()), 0700u);
    EXPECT_THAT(file.substr(mPath.size()), MatchesRegex("/[0-9a-f]{2}/[0-9a-f]{40}-gz"));
    EXPECT_FALSE(cache->Write(KeyOf(1), ImmutableString("../x"), Block(1)));
    EXPECT_FALSE(cache->Write(KeyOf(1), ImmutableString("longerthan12x"), Block(1)));
    EXPECT_FALSE(cache->Write(ImmutableString(), kName, Block(1)));
}

/// Counts the files of the cache at every moment; temporary ones have other names.
class CountingOperations : public detail::FileOperations {
public:
    int RenameAt(int inDirectory, const char* inFrom, const char* inTo) override {
        struct stat status {};
        const bool isNew = FileOperations::StatAt(inDirectory, inTo, status) != 0;
        const int result = FileOperations::RenameAt(inDirectory, inFrom, inTo);
        if (result == 0 && isNew && ++mFiles > mMost) {
            mMost = mFiles.load();
        }
        return result;
    }
    int UnlinkAt(int inDirectory, const char* inName) override {
        const int result = FileOperations::UnlinkAt(inDirectory, inName);
        mFiles -= result == 0 ? 1 : 0;
        return result;
    }
    int Most() const { return mMost; }

private:
    std::atomic<int> mFiles{0};
    std::atomic<int> mMost{0};
};

TEST_F(FileCache, IsNeverAboveItsCountWithWritersFromAllSides) {
    constexpr int kCap = 300;
    const auto operations = boost::make_shared<CountingOperations>();
    Open(operations);
    cache->SetMaxFileCount(kCap);
    std::vector<std::thread> writers;
    for (int writer = 0; writer < 4; ++writer) {
        writers.emplace_back([&, writer] {
            for (int i = 0; i < 400; ++i) {
                const int number = writer * 10000 + i;
                cache->Write(KeyOf(number), kName, Block(50));
                if (i % 3 == 0) {
                    Read(KeyOf(number - 1));
                }
            }
        });
    }
    for (std::thread& each : writers) {
        each.join();
    }
    EXPECT_TRUE(cache->WaitForWrites(60000));
    EXPECT_EQ(operations->Most(), kCap);
    EXPECT_EQ(cache->GetFileCount(), static_cast<std::size_t>(kCap));
    EXPECT_THAT(Files(), SizeIs(kCap));
    cache->SetMaxFileCount(10);
    EXPECT_TRUE(Write(1));
    EXPECT_THAT(Files(), SizeIs(10));
    EXPECT_TRUE(Has(1));
}

TEST_F(FileCache, LetsTheLeastRecentlyUsedGoAlsoAfterARestart) {
    Open();
    for (int number = 1; number <= 10; ++number) {
        EXPECT_TRUE(Write(number));
    }
    // As if they had been written yesterday, one each minute.
    const auto yesterday = std::filesystem::file_time_type::clock::now() - std::chrono::hours(24);
    for (int number = 1; number <= 10; ++number) {
        std::filesystem::last_write_time(FileOf(number), yesterday + std::chrono::minutes(number));
    }
    Open();
    EXPECT_TRUE(Has(1)) << "which makes it the one that was used last";
    Open();
    cache->SetMaxFileCount(5);
    EXPECT_TRUE(Write(11));
    EXPECT_TRUE(Has(1));
    EXPECT_FALSE(Has(2));
    EXPECT_FALSE(Has(7));
    EXPECT_TRUE(Has(8));
    EXPECT_TRUE(Has(11));
    EXPECT_THAT(Files(), SizeIs(5));
}

/// Counts how often the system is asked about an open file.
class AskingOperations : public detail::FileOperations {
public:
    int FStat(int inFile, struct stat& outStatus) override {
        ++asked;
        return FileOperations::FStat(inFile, outStatus);
    }
    std::atomic<int> asked{0};
};

TEST_F(FileCache, TrustsWhatItKnowsOfAFileUntilAnotherProcessChangesIt) {
    const auto operations = boost::make_shared<AskingOperations>();
    Open(operations);
    const auto ours = cache;
    EXPECT_TRUE(Write(KeyOf(1), Block(100)));
    const int before = operations->asked;
    EXPECT_EQ(Read(KeyOf(1))->size(), 100u);
    EXPECT_EQ(operations->asked, before) << "it was written a moment ago";
    cache.reset();
    Open();
    for (const std::size_t size : {300u, 50u, 0u}) {
        EXPECT_TRUE(Write(KeyOf(1), Block(size)));
        const QM::Payload payload = Read(KeyOf(1), ours.get());
        ASSERT_TRUE(payload);
        EXPECT_EQ(payload->size(), size);
        EXPECT_EQ(Read(KeyOf(1), ours.get())->size(), size) << "it is known again";
    }
    std::filesystem::remove(FileOf(1));
    EXPECT_FALSE(Read(KeyOf(1), ours.get()));
    EXPECT_FALSE(ours->Contains(KeyOf(1), kName));
    ours->Close(60000);
}

TEST_F(FileCache, KeepsToItsBytes) {
    Open();
    cache->SetMaxByteCount(10000);
    EXPECT_FALSE(cache->Write(KeyOf(0), kName, Block(2501)));
    for (int number = 0; number < 20; ++number) {
        EXPECT_TRUE(Write(KeyOf(number), Block(2000)));
        EXPECT_LE(cache->GetByteCount(), 10000u);
    }
    EXPECT_THAT(Files(), SizeIs(4));
    EXPECT_TRUE(Write(KeyOf(19), Block(1000))) << "in the place of the larger one";
    EXPECT_EQ(cache->GetByteCount(), 3u * 2064 + 1064);
}

TEST_F(FileCache, SweepsWhatWasLeftHalfWrittenAndNothingElse) {
    Open();
    EXPECT_TRUE(Write(1));
    const std::string shard = std::filesystem::path(Files().front()).parent_path().string();
    SetBytes(shard + "/.new-old", "half");
    SetBytes(shard + "/.new-young", "half");
    SetBytes(shard + "/notes.txt", "somebody's");
    std::filesystem::last_write_time(shard + "/.new-old",
                                     std::filesystem::file_time_type::clock::now() - std::chrono::hours(2));
    Open();
    EXPECT_TRUE(Write(2));
    EXPECT_FALSE(std::filesystem::exists(shard + "/.new-old"));
    EXPECT_TRUE(std::filesystem::exists(shard + "/.new-young"));
    EXPECT_TRUE(std::filesystem::exists(shard + "/notes.txt"));
    EXPECT_EQ(cache->GetFileCount(), 2u);
}

TEST_F(FileCache, EndsAllItsWorkWhenItIsClosed) {
    Open();
    for (int number = 1; number <= 50; ++number) {
        EXPECT_TRUE(cache->Write(KeyOf(number), kName, PayloadOf(number)));
    }
    cache->Close(60000);
    EXPECT_THAT(Files(), SizeIs(50)) << "what was accepted is written";
    EXPECT_FALSE(cache->Write(KeyOf(51), kName, PayloadOf(51)));
    EXPECT_FALSE(Read(KeyOf(1)));
    EXPECT_THAT(cache->ListNames(KeyOf(1)), IsEmpty());
}

TEST_F(CacheChain, PutsWhatComesFromFilesIntoMemory) {
    Open();
    EXPECT_TRUE(Write(1));
    Open();
    const auto memory = CreateDataCacheInMemory();
    const auto chain = CreateDataCacheChain(memory, cache);
    EXPECT_THAT(chain->ListNames(KeyOf(1)), ElementsAre(kName));
    EXPECT_TRUE(Read(KeyOf(1), chain.get()));
    EXPECT_TRUE(memory->Contains(KeyOf(1), kName));
    Payload atOnce;
    EXPECT_EQ(chain->Read(
                  KeyOf(1), kName, [](int, const Payload&) { FAIL(); }, atOnce),
              kResultContentAvailable);
    EXPECT_THAT(chain->ListNames(KeyOf(1)), ElementsAre(kName));

    EXPECT_TRUE(chain->Write(KeyOf(2), kName, PayloadOf(2)));
    EXPECT_TRUE(chain->WaitForWrites(60000));
    EXPECT_TRUE(memory->Contains(KeyOf(2), kName));
    EXPECT_TRUE(Has(2));
    chain->Remove(KeyOf(2), kName);
    EXPECT_FALSE(chain->Contains(KeyOf(2), kName));
    EXPECT_FALSE(Has(2));
    EXPECT_EQ(CreateDataCacheChain(memory, nullptr), memory);
}

}  // namespace
