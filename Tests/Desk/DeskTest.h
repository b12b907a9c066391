// A desk before a hub with a production of real media, and a user who looks, clicks and types.
#pragma once

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <QtTest/QtTest>
#include <QtWidgets/QtWidgets>

#include "Host.h"
#include "HubProcess.h"

namespace Desk {

/// Nothing waits this long when all is well.
constexpr int kPatience = 60000;

class DeskTest : public testing::Test {
protected:
    DeskTest() {
        namespace fs = std::filesystem;
        for (const char* const name : {"CONFIG", "STATE"}) {
            const std::string path = hub.Directory() + "/desk-" + name;
            setenv(("ZOCLIENT_" + std::string(name) + "_HOME").c_str(), path.c_str(), 1);
        }
        hub.AddUser("otto");
        EXPECT_EQ(Run({ZO_HUB_PROGRAM, "import", ZO_MEDIA, "--production", "Harbour Film", "--owner", "anna",
                       "--grant", "otto", "--data", hub.Directory() + "/data"})
                      .code,
                  0);
    }
    ~DeskTest() override {
        host.reset();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        EXPECT_TRUE(QApplication::topLevelWidgets().isEmpty());
    }

    struct Ended {
        int code;
        std::string text;
    };
    /// Another program, to its end; what it writes on both its outputs.
    Ended Run(const std::vector<std::string>& inWords) const {
        const std::string path = hub.Directory() + "/output";
        const int file = open(path.c_str(), O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
        const int former = dup(STDERR_FILENO);
        dup2(file, STDERR_FILENO);
        const pid_t child = ZOCL::Spawn(inWords, file);
        dup2(former, STDERR_FILENO);
        close(former);
        int status = -1;
        waitpid(child, &status, 0);
        close(file);
        std::ifstream stream(path);
        return {WEXITSTATUS(status), std::string(std::istreambuf_iterator<char>(stream), {})};
    }
    /// zo of a user on another machine, as it were: with directories of its own.
    Ended ZoOf(const std::string& inUser, const std::vector<std::string>& inWords) const {
        const std::string home = hub.Directory() + "/zo-" + inUser;
        std::vector<std::string> words{"/usr/bin/env", "ZOCLIENT_CONFIG_HOME=" + home + "/config",
                                       "ZOCLIENT_STATE_HOME=" + home + "/state", ZO_PROGRAM};
        words.insert(words.end(), inWords.begin(), inWords.end());
        return Run(words);
    }
    Ended Zo(const std::vector<std::string>& inWords) const { return ZoOf("anna", inWords); }
    void SignInZo(const std::string& inUser = "anna") const {
        const std::string password = hub.Directory() + "/password";
        std::ofstream(password) << inUser << "s-secret\n";
        EXPECT_EQ(ZoOf(inUser,
                       {"login", "--server", hub.URL().str(), "--user", inUser, "--password-file", password})
                      .code,
                  0);
        EXPECT_EQ(ZoOf(inUser, {"open", "Harbour Film"}).code, 0);
    }
    /// Replaces a text in the packet of the slate.
    void EditElsewhere(const std::string& inUser, const std::string& inFrom, const std::string& inTo) const {
        std::string packet = ZoOf(inUser, {"xmp", "get", "slate.png"}).text;
        const std::size_t at = packet.find(inFrom);
        ASSERT_NE(at, std::string::npos) << packet;
        packet.replace(at, inFrom.size(), inTo);
        std::ofstream(hub.Directory() + "/edited.xmp") << packet;
        EXPECT_EQ(ZoOf(inUser, {"xmp", "set", "slate.png", hub.Directory() + "/edited.xmp"}).code, 0);
    }

    void StartDesk(const QString& inProduction = QStringLiteral("Harbour Film")) {
        StartOptions options;
        options.login = {QString::fromStdString(hub.URL().str()), QStringLiteral("anna"), false};
        options.production = inProduction;
        host = std::make_unique<Host>(options);
    }
    MainWindow& Window() const { return host->GetWindow(); }
    /// Fails the test when it never comes.
    static void WaitFor(const char* inWhat, const std::function<bool()>& inCondition) {
        EXPECT_TRUE(QTest::qWaitFor(inCondition, kPatience)) << inWhat;
    }
    template <class Widget>
    static Widget* FindTop(const char* inName) {
        for (QWidget* const widget : QApplication::topLevelWidgets()) {
            if (widget->objectName() == QLatin1String(inName) && widget->isVisible()) {
                return qobject_cast<Widget*>(widget);
            }
        }
        return nullptr;
    }
    template <class Widget = QWidget>
    static Widget* Find(const QWidget& inWindow, const char* inName) {
        auto* const widget = inWindow.findChild<Widget*>(QLatin1String(inName));
        EXPECT_NE(widget, nullptr) << inName;
        return widget;
    }
    /// As a user does, who waits until it can be clicked on.
    static void Click(QWidget* inWidget) {
        WaitFor("something to click on", [inWidget] { return inWidget && inWidget->isEnabled(); });
        QTest::mouseClick(inWidget, Qt::LeftButton);
    }
    static void Type(QLineEdit* ioEdit, const char* inText) {
        ioEdit->selectAll();
        QTest::keyClicks(ioEdit, QString::fromUtf8(inText));
    }
    /// By its words, whatever its mnemonic.
    static QAbstractButton* FindButton(const QWidget& inWindow, const char* inText) {
        for (QAbstractButton* const button : inWindow.findChildren<QAbstractButton*>()) {
            if (button->text().remove(QLatin1Char('&')) == QLatin1String(inText) && button->isVisible()) {
                return button;
            }
        }
        return nullptr;
    }
    void SignIn() {
        WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
        QDialog& window = *FindTop<QDialog>("signInWindow");
        QTest::keyClicks(Find<QLineEdit>(window, "password"), QStringLiteral("annas-secret"));
        Click(Find(window, "signIn"));
    }
    /// The desk with its production open, and its state known.
    void OpenDesk() {
        StartDesk();
        SignIn();
        WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });
        WaitForStatus("statusWork", "Nothing to share");
    }
    QTreeView& Tree() const { return *Find<QTreeView>(Window(), "assets"); }
    QString Status(const char* inItem) const {
        const QWidget* const item = Find(Window(), inItem);
        return item->isVisible() ? item->accessibleName() : QString();
    }
    void WaitForStatus(const char* inItem, const char* inText) const {
        WaitFor(inText, [&] { return Status(inItem) == QLatin1String(inText); });
    }
    /// Finds an asset by typing into the search, and clicks on it.
    void ChooseAsset(const char* inName) const {
        Type(Find<QLineEdit>(Window(), "search"), inName);
        const QModelIndexList found =
            Tree().model()->match(Tree().model()->index(0, 0), Qt::DisplayRole, QString::fromUtf8(inName), 1,
                                  Qt::MatchContains | Qt::MatchRecursive);
        ASSERT_FALSE(found.isEmpty()) << inName;
        Tree().scrollTo(found.front());
        QTest::mouseClick(Tree().viewport(), Qt::LeftButton, {}, Tree().visualRect(found.front()).center());
    }
    QLineEdit* WaitForField(const char* inName) const {
        WaitFor(inName, [&] { return Window().findChild<QLineEdit*>(QLatin1String(inName)) != nullptr; });
        return Window().findChild<QLineEdit*>(QLatin1String(inName));
    }
    void EditTitle(const char* inTitle) const {
        ChooseAsset("slate");
        WaitFor("the packet of the slate", [this] {
            const auto* const field = Window().findChild<QLineEdit*>(QStringLiteral("title"));
            return field && !field->text().isEmpty();
        });
        Type(WaitForField("title"), inTitle);
    }

    /// Acts in the modal window that comes up, as soon as it can be acted in.
    void InNextWindow(const std::function<bool(QDialog& ioWindow)>& inUser) {
        auto* const timer = new QTimer(&Window());
        timer->setInterval(10);
        QElapsedTimer clock;
        clock.start();
        QObject::connect(timer, &QTimer::timeout, timer, [timer, inUser, clock] {
            auto* const window = qobject_cast<QDialog*>(QApplication::activeModalWidget());
            const bool isDone = window && inUser(*window);
            if (!isDone && clock.elapsed() > kPatience) {
                // A modal window that nobody answers would stay for ever.
                ADD_FAILURE() << "not to be answered: " << (window ? TextsOf(*window) : "no window");
                if (window) {
                    window->reject();
                }
            }
            if (isDone || (!window && clock.elapsed() > kPatience)) {
                timer->stop();
                timer->deleteLater();
            }
        });
        timer->start();
    }
    static std::string TextsOf(const QDialog& inWindow) {
        QStringList texts{inWindow.windowTitle()};
        for (const QLabel* const label : inWindow.findChildren<QLabel*>()) {
            texts << label->text();
        }
        for (const QAbstractButton* const button : inWindow.findChildren<QAbstractButton*>()) {
            texts << button->text();
        }
        return texts.join(QLatin1String(" | ")).toStdString();
    }
    static bool Press(QDialog& ioWindow, const char* inText) {
        QAbstractButton* const button = FindButton(ioWindow, inText);
        if (!button || !button->isEnabled()) {
            return false;
        }
        Click(button);
        return true;
    }

    ZOCL::RunningHub hub;
    std::unique_ptr<Host> host;
};

}  // namespace Desk
