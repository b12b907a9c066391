// Dialogs on a terminal: one is on the screen, those around it wait.
#include "ostui/TerminalBackEnd.h"

#include <vector>

#include "ostui/detail/Terminal.h"
#include "ostui/detail/TerminalRun.h"

namespace ostui {
namespace {

class TerminalBackEnd final : public BackEnd {
public:
    explicit TerminalBackEnd(const TerminalSettings& inSettings) : mTerminal(inSettings) {}

    void RunModal(Dialog& ioDialog) override {
        detail::TerminalRun run(mTerminal, ioDialog);
        const Entry entry(*this, ioDialog, run);
        run.Run();
    }

    void OnControlChanged(Dialog& ioDialog, const Control& inControl) override {
        for (const Running& running : mRunning) {
            if (running.dialog == &ioDialog) {
                running.run->OnControlChanged(inControl);
                return;
            }
        }
    }

private:
    struct Running {
        Dialog* dialog;
        detail::TerminalRun* run;
    };

    /// Puts a run on top of the others, for a scope.
    class Entry {
    public:
        Entry(TerminalBackEnd& ioBackEnd, Dialog& ioDialog, detail::TerminalRun& ioRun)
            : mBackEnd(ioBackEnd) {
            if (!mBackEnd.mRunning.empty()) {
                mBackEnd.mRunning.back().run->OnCovered();
            }
            mBackEnd.mRunning.push_back({&ioDialog, &ioRun});
        }
        ~Entry() {
            mBackEnd.mRunning.pop_back();
            if (!mBackEnd.mRunning.empty()) {
                mBackEnd.mRunning.back().run->OnUncovered();
            }
        }
        Entry(const Entry&) = delete;
        Entry& operator=(const Entry&) = delete;

    private:
        TerminalBackEnd& mBackEnd;
    };

    detail::Terminal mTerminal;
    std::vector<Running> mRunning;
};

}  // namespace

shared_ptr<BackEnd> CreateTerminalBackEnd(const TerminalSettings& inSettings) {
    return boost::make_shared<TerminalBackEnd>(inSettings);
}

}  // namespace ostui
