// The registry between real processes: no update is lost, whoever is killed or stopped.
#include <signal.h>

#include <chrono>
#include <memory>
#include <random>

#include "Process.h"
#include "RegistryFixture.h"
#include "RegistryWorker.h"

using namespace RFL;
using ostcore::UString;

class RegistryProcesses : public RegistryFixture {
protected:
    static std::unique_ptr<Process> Start(std::vector<std::string> inArguments) {
        inArguments.insert(inArguments.begin(), kRegistryWorkerFlag);
        return std::make_unique<Process>(inArguments);
    }
    /// The size of a run: small by default, as large as the environment wants it for a campaign.
    static int SizeOfRun(const char* inVariable, int inDefault) {
        const char* wanted = std::getenv(inVariable);
        return wanted ? std::atoi(wanted) : inDefault;
    }
};

TEST_F(RegistryProcesses, LoseNoUpdateOfEachOther) {
    const int processes = 8;
    const int each = SizeOfRun("ZOCLIENT_TEST_REGISTRY_TRANSACTIONS", 2000) / processes;
    std::vector<std::unique_ptr<Process>> workers;
    for (int worker = 0; worker < processes; ++worker) {
        workers.push_back(Start({"increment", std::to_string(each), "5000"}));
    }
    for (const auto& worker : workers) {
        EXPECT_EQ(worker->Wait(), 0);
    }
    std::uint32_t value = 0;
    EXPECT_EQ(MakeKey(kWorkerKey).GetUInt32Value(u"Counter", value), 0);
    EXPECT_EQ(value, static_cast<std::uint32_t>(processes * each));
}

TEST_F(RegistryProcesses, AreNotStoppedByOneThatIsKilledWhileItWrites) {
    std::mt19937 random(20160331);
    for (int round = SizeOfRun("ZOCLIENT_TEST_REGISTRY_KILLS", 25); round > 0; --round) {
        const auto writer = Start({"pairs"});
        std::string line;
        for (int lines = std::uniform_int_distribution<int>(1, 60)(random); lines > 0; --lines) {
            ASSERT_TRUE(writer->ReadLine(line));
        }
        writer->Signal(SIGKILL);
        EXPECT_EQ(writer->Wait(), 128 + SIGKILL);
        while (writer->ReadLine(line)) {
        }
        std::uint32_t first = 0;
        std::uint32_t second = 1;
        const RegistryKey key = MakeKey(kWorkerKey);
        EXPECT_EQ(key.GetUInt32Value(u"A", first), 0);
        EXPECT_EQ(key.GetUInt32Value(u"B", second), 0);
        EXPECT_EQ(first, second) << "half a transaction";
        EXPECT_GE(first, static_cast<std::uint32_t>(std::stoul(line))) << "what was told as written is lost";
        CloseRegistry();
        ASSERT_EQ(Ask(File(), "PRAGMA integrity_check"), "ok");
    }
}

TEST_F(RegistryProcesses, AWriterThatIsStoppedCostsOthersABoundedTime) {
    RegistryKey key = MakeKey(kWorkerKey);
    EXPECT_EQ(key.SetStringValue(u"Text", u"before"), 0);
    const auto holder = Start({"hold"});
    std::string line;
    ASSERT_TRUE(holder->ReadLine(line));
    holder->Signal(SIGSTOP);

    SetRegistryTimeLimit(std::chrono::milliseconds(150));
    const auto start = std::chrono::steady_clock::now();
    std::uint32_t value = 0;
    EXPECT_EQ(key.SetStringValue(u"Text", u"after"), kResultRegistryBusy);
    EXPECT_EQ(key.IncrementUInt32Value(u"Counter", 1, value), kResultRegistryBusy);
    RegistryKey other;
    EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, u"Software\\Other", other), kResultRegistryBusy);
    const auto elapsed = std::chrono::steady_clock::now() - start;
    EXPECT_GE(elapsed, std::chrono::milliseconds(450));
    EXPECT_LT(elapsed, std::chrono::seconds(10));

    UString text;
    EXPECT_EQ(key.GetStringValue(u"Text", text), 0) << "readers are not kept waiting";
    EXPECT_EQ(text, u"before");

    holder->Signal(SIGKILL);
    holder->Wait();
    SetRegistryTimeLimit(std::chrono::seconds(20));
    EXPECT_EQ(key.SetStringValue(u"Text", u"after"), 0);
    EXPECT_EQ(key.GetStringValue(u"Text", text), 0);
    EXPECT_EQ(text, u"after");
}

TEST_F(RegistryProcesses, GoOnWithoutLossWhenAStoppedWriterIsGone) {
    MakeKey(kWorkerKey);
    const auto holder = Start({"hold"});
    std::string line;
    ASSERT_TRUE(holder->ReadLine(line));
    holder->Signal(SIGSTOP);
    std::vector<std::unique_ptr<Process>> workers;
    for (int worker = 0; worker < 4; ++worker) {
        workers.push_back(Start({"increment", "100", "50"}));
    }
    for (const auto& worker : workers) {
        ASSERT_TRUE(worker->ReadLine(line));
        EXPECT_EQ(line, "busy");
    }
    holder->Signal(SIGKILL);
    for (const auto& worker : workers) {
        EXPECT_EQ(worker->Wait(), 0);
    }
    std::uint32_t value = 0;
    EXPECT_EQ(MakeKey(kWorkerKey).GetUInt32Value(u"Counter", value), 0);
    EXPECT_EQ(value, 400u);
}

TEST_F(RegistryProcesses, AFullDiskIsATypedErrorAndHarmsNothing) {
    const auto writer = Start({"fill"});
    EXPECT_EQ(writer->Wait(), 0);
    const RegistryKey key = MakeKey(kWorkerKey);
    std::uint32_t last = 0;
    UString text;
    EXPECT_EQ(key.GetUInt32Value(u"Last", last), 0);
    const std::string name = std::to_string(last);
    EXPECT_EQ(key.GetStringValue(UString(name.begin(), name.end()), text), 0);
    EXPECT_EQ(text.size(), 20000u);
    EXPECT_EQ(key.GetStringValue(u"After", text), 0);
    CloseRegistry();
    EXPECT_EQ(Ask(File(), "PRAGMA integrity_check"), "ok");
    EXPECT_EQ(Ask(File(), "SELECT count(*) FROM vals WHERE name GLOB '[0-9]*'"), name)
        << "each batch whole or not";
}
