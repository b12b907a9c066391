// A terminal whose user the test plays.
#pragma once

#include <poll.h>
#include <pty.h>
#include <unistd.h>

#include <cerrno>
#include <string>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace ostui {

class UserTerminal {
public:
    /// 0 columns: it does not say how wide it is.
    explicit UserTerminal(unsigned short inColumns = 0) {
        winsize size{};
        size.ws_col = inColumns;
        if (openpty(&mUser, &mProgram, nullptr, nullptr, &size) != 0) {
            throw std::system_error(errno, std::generic_category(), "no pseudo-terminal");
        }
    }
    ~UserTerminal() {
        HangUp();
        close(mProgram);
    }
    UserTerminal(const UserTerminal&) = delete;
    UserTerminal& operator=(const UserTerminal&) = delete;

    int Program() const { return mProgram; }

    /// What is waited for, and what is typed then.
    using Turn = std::pair<std::string, std::string>;
    /// Plays the turns on a thread of its own while the program runs, and gives all that was on the screen.
    template <class Program>
    std::string Play(const std::vector<Turn>& inTurns, const Program& inProgram) {
        std::string screen;
        std::thread user([&] {
            for (const auto& [prompt, answer] : inTurns) {
                screen += WaitFor(prompt);
                Type(answer);
            }
        });
        inProgram();
        user.join();
        return screen + ReadAll();
    }

    void Type(const std::string& inText) {
        if (mUser >= 0) {
            EXPECT_EQ(write(mUser, inText.data(), inText.size()), static_cast<ssize_t>(inText.size()));
        }
    }

    /// Reads until the text has appeared; all that was shown since the last call, with plain line ends. A
    /// text that does not come hangs up, so that the program sees the end of its input.
    std::string WaitFor(const std::string& inText) {
        std::string shown;
        while (mUser >= 0 && shown.find(inText) == std::string::npos) {
            if (!ReadOne(shown, kPatienceMilliseconds)) {
                ADD_FAILURE() << "waited for \"" << inText << "\" and saw \"" << shown << "\"";
                HangUp();
            }
        }
        return shown;
    }

    void HangUp() {
        if (mUser >= 0) {
            close(mUser);
        }
        mUser = -1;
    }

private:
    static constexpr int kPatienceMilliseconds = 60000;

    std::string ReadAll() {
        std::string shown;
        while (mUser >= 0 && ReadOne(shown, 0)) {
        }
        return shown;
    }

    bool ReadOne(std::string& ioShown, int inMilliseconds) {
        pollfd watched{mUser, POLLIN, 0};
        char character = 0;
        if (poll(&watched, 1, inMilliseconds) != 1 || read(mUser, &character, 1) != 1) {
            return false;
        }
        if (character == '\n' && !ioShown.empty() && ioShown.back() == '\r') {
            ioShown.pop_back();
        }
        ioShown += character;
        return true;
    }

    int mUser = -1;
    int mProgram = -1;
};

}  // namespace ostui
