// The registry within one process: keys, values, conditions, modes of files, and files that are none.
#include <sys/wait.h>
#include <unistd.h>

#include <thread>

#include "RegistryFixture.h"

using namespace RFL;
using ostcore::UString;

class Registry : public RegistryFixture {};

TEST_F(Registry, ValuesOfEachTypeComeBack) {
    RegistryKey key = MakeKey(u"Software\\Test\\2.0\\");
    UString text = u"kept";
    std::uint32_t number = 7;
    bool truth = true;
    EXPECT_EQ(key.GetStringValue(u"Text", text), kResultRegistryMissing);
    EXPECT_EQ(text, u"kept");
    EXPECT_EQ(key.SetStringValue(u"Text", u"a\u00e9\U0001F600\\\0z"), 0);
    EXPECT_EQ(key.SetUInt32Value(u"Number", 0xFFFFFFFFu), 0);
    EXPECT_EQ(key.SetBooleanValue(u"Truth", false), 0);
    EXPECT_EQ(key.GetStringValue(u"Text", text), 0);
    EXPECT_EQ(text, u"a\u00e9\U0001F600\\");
    EXPECT_EQ(key.GetUInt32Value(u"Number", number), 0);
    EXPECT_EQ(number, 0xFFFFFFFFu);
    EXPECT_EQ(key.GetBooleanValue(u"Truth", truth), 0);
    EXPECT_FALSE(truth);
    EXPECT_EQ(key.GetStringValue(u"Number", text), kResultRegistryWrongType);
    EXPECT_EQ(key.GetUInt32Value(u"Truth", number), kResultRegistryWrongType);
    EXPECT_EQ(key.GetStringValue(u"text", text), kResultRegistryMissing) << "names are exact";
    EXPECT_EQ(key.SetStringValue(u"Number", u""), 0);
    EXPECT_EQ(key.GetStringValue(u"Number", text), 0);
    EXPECT_EQ(text, u"");
    EXPECT_EQ(key.DeleteValue(u"Text"), 0);
    EXPECT_EQ(key.DeleteValue(u"Text"), kResultRegistryMissing);
    std::vector<UString> names;
    EXPECT_EQ(key.EnumerateValues(names), 0);
    EXPECT_EQ(names, (std::vector<UString>{u"Number", u"Truth"}));
    EXPECT_EQ(key.SyncAppPrefs(), 0);
}

TEST_F(Registry, KeysFormATree) {
    RegistryKey key;
    EXPECT_EQ(RegistryKey::Open(RegistryRoot::User, u"Software", RegistryAccess::Read, key),
              kResultRegistryMissing);
    EXPECT_EQ(ModeOf(File()), 0u) << "reading makes no file";
    bool isCreated = false;
    EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, u"\\Software\\\\Test\\", key, &isCreated), 0);
    EXPECT_TRUE(isCreated);
    EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, u"Software\\Test", key, &isCreated), 0);
    EXPECT_FALSE(isCreated);
    RegistryKey child;
    for (const char16_t* name : {u"b", u"a", u"a\\deep", u"a]", u"a!"}) {
        EXPECT_EQ(key.CreateSubKey(name, child), 0);
        EXPECT_EQ(child.SetStringValue(u"v", name), 0);
    }
    std::vector<UString> names;
    EXPECT_EQ(key.EnumerateSubKeys(names), 0);
    EXPECT_EQ(names, (std::vector<UString>{u"a", u"a!", u"a]", u"b"}));
    EXPECT_EQ(key.DeleteSubKey(u"a"), 0);
    EXPECT_EQ(key.DeleteSubKey(u"a"), kResultRegistryMissing);
    EXPECT_EQ(key.OpenSubKey(u"a\\deep", RegistryAccess::Read, child), kResultRegistryMissing);
    UString text;
    EXPECT_EQ(key.OpenSubKey(u"a]", RegistryAccess::Read, child), 0);
    EXPECT_EQ(child.GetStringValue(u"v", text), 0);
    EXPECT_EQ(child.SetStringValue(u"v", u"x"), kResultRegistryReadOnly);
    EXPECT_EQ(RegistryKey::Open(RegistryRoot::User, u"software\\test", RegistryAccess::Read, key),
              kResultRegistryMissing);
}

TEST_F(Registry, NamesThatCannotBeAreRefused) {
    RegistryKey key;
    UString deep;
    for (int level = 0; level < 40; ++level) {
        deep += u"k\\";
    }
    for (const UString& path : {UString(), UString(u"\\\\"), UString(u"a\0b", 3), UString(300, u'k'), deep}) {
        EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, path, key), kResultRegistryBadName);
    }
    key = MakeKey(u"Software");
    EXPECT_EQ(key.SetStringValue(u"", u"x"), kResultRegistryBadName);
    EXPECT_EQ(key.DeleteSubKey(u"\\"), kResultRegistryBadName) << "a key does not delete itself";
    EXPECT_EQ(RegistryKey().SetStringValue(u"a", u"x"), kResultRegistryBadName);
    EXPECT_EQ(key.SetStringValue(u"'; DROP TABLE keys; --", u"x"), 0);
    EXPECT_EQ(key.EnumerateSubKeys(*std::make_unique<std::vector<UString>>()), 0);
}

TEST_F(Registry, ABatchIsAppliedAsAWholeOrNotAtAll) {
    RegistryKey key = MakeKey(u"Software");
    UString text;
    EXPECT_EQ(key.Apply({RegistryChange::ExpectAbsent(u"User"), RegistryChange::SetString(u"User", u"u1"),
                         RegistryChange::SetString(u"Token", u"t1")}),
              0);
    EXPECT_EQ(key.Apply({RegistryChange::SetString(u"Token", u"t2"), RegistryChange::ExpectAbsent(u"User")}),
              kResultRegistryChanged);
    EXPECT_EQ(key.GetStringValue(u"Token", text), 0);
    EXPECT_EQ(text, u"t1");
    EXPECT_EQ(key.DeleteStringValueIf(u"Token", u"other"), kResultRegistryChanged);
    EXPECT_EQ(key.DeleteStringValueIf(u"Token", u"t1"), 0);
    EXPECT_EQ(key.DeleteStringValueIf(u"Token", u"t1"), kResultRegistryChanged);
    EXPECT_EQ(key.GetStringValue(u"Token", text), kResultRegistryMissing);
    std::uint32_t number = 0;
    EXPECT_EQ(key.IncrementUInt32Value(u"User", 1, number), kResultRegistryWrongType);
    EXPECT_EQ(key.IncrementUInt32Value(u"Count", 0xFFFFFFFFu, number), 0);
    EXPECT_EQ(key.IncrementUInt32Value(u"Count", 2, number), 0);
    EXPECT_EQ(number, 1u);
}

TEST_F(Registry, ManyThreadsLoseNoUpdate) {
    std::vector<std::thread> threads;
    std::atomic<int> failures{0};
    for (int thread = 0; thread < 4; ++thread) {
        threads.emplace_back([&] {
            RegistryKey key;
            failures += RegistryKey::Create(RegistryRoot::User, u"Software\\Count", key) != 0;
            for (int step = 0; step < 100; ++step) {
                std::uint32_t value = 0;
                failures += key.IncrementUInt32Value(u"Counter", 1, value) != 0;
                failures += key.GetUInt32Value(u"Counter", value) != 0;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    std::uint32_t value = 0;
    EXPECT_EQ(MakeKey(u"Software\\Count").GetUInt32Value(u"Counter", value), 0);
    EXPECT_EQ(value, 400u);
    EXPECT_EQ(failures, 0);
}

TEST_F(Registry, FilesArePrivateWhateverTheUmask) {
    for (const mode_t mask : {mode_t(0), mode_t(0777)}) {
        const mode_t former = ::umask(mask);
        RegistryKey key = MakeKey(u"Software");
        key.SetStringValue(u"Token", u"secret");
        ::umask(former);
        EXPECT_EQ(ModeOf(mDirectory + "/config"), 0700u);
        for (const char* suffix : {"", "-wal", "-shm"}) {
            EXPECT_EQ(ModeOf(File() + suffix), 0600u) << suffix;
        }
        CloseRegistry();
        std::filesystem::remove_all(mDirectory + "/config");
    }
    WriteFile("");
    std::filesystem::permissions(File(), std::filesystem::perms(0644));
    MakeKey(u"Software");
    EXPECT_EQ(ModeOf(File()), 0600u) << "a file that is too open is narrowed";
}

TEST_F(Registry, TheMachineRootIsReadByAllAndApart) {
    RegistryKey key;
    EXPECT_EQ(RegistryKey::Open(RegistryRoot::Machine, u"Software", RegistryAccess::Read, key),
              kResultRegistryMissing);
    EXPECT_EQ(RegistryKey::Create(RegistryRoot::Machine, u"Software", key), 0);
    EXPECT_EQ(key.SetStringValue(u"ServerVersion", u"1.2.0"), 0);
    CloseRegistry();
    EXPECT_EQ(ModeOf(mDirectory + "/machine/registry.sqlite"), 0644u);
    EXPECT_FALSE(std::filesystem::exists(mDirectory + "/machine/registry.sqlite-wal"))
        << "readers without the right to write could not use a log";
    std::filesystem::permissions(mDirectory + "/machine", std::filesystem::perms(0555));
    UString text;
    EXPECT_EQ(RegistryKey::Open(RegistryRoot::Machine, u"Software", RegistryAccess::Read, key), 0);
    EXPECT_EQ(key.GetStringValue(u"ServerVersion", text), 0);
    EXPECT_EQ(text, u"1.2.0");
    EXPECT_EQ(RegistryKey::Open(RegistryRoot::User, u"Software", RegistryAccess::Read, key),
              kResultRegistryMissing);
    std::filesystem::permissions(mDirectory + "/machine", std::filesystem::perms(0755));
}

TEST_F(Registry, FilesThatAreNoRegistryGiveATypedErrorAndStayAsTheyAre) {
    MakeKey(u"Software").SetStringValue(u"Text", UString(20000, u'x'));
    CloseRegistry();
    const std::string good = BytesOf(File());
    ASSERT_GT(good.size(), 8192u);
    std::string torn = good;
    for (std::size_t at = 100; at < torn.size(); at += 3) {
        torn[at] = '\x5A';
    }
    std::string newer = good;
    newer[63] = 2;
    const std::pair<const char*, std::string> cases[] = {{"text", "this is not a database, it is a letter\n"},
                                                         {"torn", torn},
                                                         {"newer", newer},
                                                         {"cut", good.substr(0, 4096)},
                                                         {"half a header", good.substr(0, 60)}};
    for (const auto& [name, bytes] : cases) {
        std::filesystem::remove_all(mDirectory + "/config");
        WriteFile(bytes);
        RegistryKey key;
        UString text;
        int result = RegistryKey::Open(RegistryRoot::User, u"Software", RegistryAccess::ReadWrite, key);
        if (result == 0) {
            result = key.GetStringValue(u"Text", text);
        }
        EXPECT_EQ(result, kResultRegistryDamaged) << name;
        EXPECT_LT(RegistryKey::Create(RegistryRoot::User, u"Software\\New", key), 0) << name;
        CloseRegistry();
        EXPECT_EQ(BytesOf(File()), bytes) << name;
    }
}

TEST_F(Registry, ForeignFilesAreNotTouched) {
    WriteFile("");
    Ask(File(), "CREATE TABLE bookmarks(url TEXT); INSERT INTO bookmarks VALUES('x')");
    const std::string before = BytesOf(File());
    RegistryKey key;
    EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, u"Software", key), kResultRegistryDamaged);
    EXPECT_EQ(BytesOf(File()), before);

    const std::string target = mDirectory + "/elsewhere";
    std::filesystem::rename(File(), target);
    std::filesystem::create_symlink(target, File());
    EXPECT_LT(RegistryKey::Create(RegistryRoot::User, u"Software", key), 0) << "links are not followed";
    EXPECT_EQ(BytesOf(target), before);
    std::filesystem::remove(File());
    ASSERT_EQ(::mkfifo(File().c_str(), 0600), 0);
    EXPECT_LT(RegistryKey::Create(RegistryRoot::User, u"Software", key), 0);
    std::filesystem::remove(File());
    std::filesystem::create_directory(File());
    EXPECT_LT(RegistryKey::Create(RegistryRoot::User, u"Software", key), 0);
}

TEST_F(Registry, AFileThatWasReplacedIsFoundAnew) {
    RegistryKey key = MakeKey(u"Software");
    EXPECT_EQ(key.SetStringValue(u"Text", u"old"), 0);
    std::filesystem::remove_all(mDirectory + "/config");
    UString text;
    EXPECT_EQ(key.GetStringValue(u"Text", text), kResultRegistryMissing);
    EXPECT_EQ(key.SetStringValue(u"Text", u"new"), 0);
    CloseRegistry();
    EXPECT_EQ(Ask(File(), "SELECT data FROM vals"), "new");
}

TEST_F(Registry, AChildOfForkOpensItsOwnConnections) {
    RegistryKey key = MakeKey(u"Software");
    std::uint32_t value = 0;
    EXPECT_EQ(key.IncrementUInt32Value(u"Counter", 1, value), 0);
    const pid_t child = ::fork();
    if (child == 0) {
        int failures = 0;
        for (int step = 0; step < 50; ++step) {
            failures += key.IncrementUInt32Value(u"Counter", 1, value) != 0;
        }
        ::_exit(failures);
    }
    for (int step = 0; step < 50; ++step) {
        EXPECT_EQ(key.IncrementUInt32Value(u"Counter", 1, value), 0);
    }
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(key.GetUInt32Value(u"Counter", value), 0);
    EXPECT_EQ(value, 101u);
    CloseRegistry();
    EXPECT_EQ(Ask(File(), "PRAGMA integrity_check"), "ok");
}
