// Takes a picture of every window of the desk, light and dark, into the folder that DESK_PICTURES names.
#include "DeskTest.h"

namespace Desk {
namespace {

using ZOClientQt::ColorScheme;

class Pictures : public DeskTest, public testing::WithParamInterface<ColorScheme> {
protected:
    Pictures() {
        ZOClientQt::UseModernStyle(GetParam());
        std::filesystem::create_directories(Folder());
    }
    static std::string Folder() {
        const char* const named = std::getenv("DESK_PICTURES");
        return named ? named : "pictures";
    }
    static void Take(QWidget& ioWindow, const char* inName) {
        // Lets layouts and bars settle.
        QTest::qWait(400);
        const std::string path =
            Folder() + "/Desk-" + inName + (GetParam() == ColorScheme::kDark ? "-dark.png" : "-light.png");
        ASSERT_TRUE(ioWindow.grab().save(QString::fromStdString(path))) << path;
        std::printf("%s\n", path.c_str());
    }
    static QDialog& Top(const char* inName) {
        WaitFor(inName, [inName] { return FindTop<QDialog>(inName) != nullptr; });
        return *FindTop<QDialog>(inName);
    }
};

TEST_P(Pictures, OfEveryWindow) {
    StartDesk(QString());
    QDialog& signIn = Top("signInWindow");
    Take(signIn, "SignIn");
    Take(Window(), "SignedOut");
    QTest::keyClicks(Find<QLineEdit>(signIn, "password"), QStringLiteral("wrong"));
    Click(Find(signIn, "signIn"));
    WaitFor("the refusal", [&] { return Find<QLabel>(signIn, "message")->isVisible(); });
    Take(signIn, "SignIn-refused");
    SignIn();
    QDialog& chooser = Top("productionWindow");
    WaitFor("the productions",
            [&] { return Find<QTreeWidget>(chooser, "productions")->topLevelItemCount() > 0; });
    Take(chooser, "Productions");
    Click(Find(chooser, "open"));
    WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });
    WaitForStatus("statusWork", "Nothing to share");
    Take(Window(), "Main");

    EditTitle("Slate of day two");
    Find<QLineEdit>(Window(), "search")->clear();
    Tree().expandAll();
    Take(Window(), "Main-edited");
    Window().close();
    WaitFor("the question", [this] { return Window().findChild<QMessageBox*>() != nullptr; });
    Take(*Window().findChild<QMessageBox*>(), "Unsaved");
    Click(FindButton(*Window().findChild<QMessageBox*>(), "Cancel"));
    Click(Find(Window(), "metadataSave"));
    WaitForStatus("statusWork", "You have changes to share");
    SignInZo("otto");
    EditElsewhere("otto", "<rdf:li xml:lang=\"x-default\">Slate</rdf:li>",
                  "<rdf:li xml:lang=\"x-default\">Otto's slate</rdf:li>");
    EXPECT_EQ(
        ZoOf("otto", {"share", "-m", "Titles of the second day checked against the camera report"}).code, 0);
    WaitForStatus("statusTeam", "The team has shared something newer");
    Take(Window(), "Main-behind");
    Click(Find(Window(), "historyButton"));
    QDialog& history = Top("historyWindow");
    WaitFor("the commits", [&] { return history.findChild<QTreeWidget*>()->topLevelItemCount() > 0; });
    Take(history, "History");
    history.close();

    hub.Signal(SIGSTOP);
    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    WaitFor("the load", [this] { return Find(Window(), "statusCancel")->isVisible(); });
    Take(Window(), "Main-loading");
    Click(Find(Window(), "statusCancel"));
    hub.Signal(SIGCONT);
    host.reset();

    StartDesk(QStringLiteral("No Such Film"));
    WaitFor("the reason", [&] { return Find<QLabel>(Window(), "messageText")->isVisible(); });
    Take(Window(), "NoSuchProduction");
}

INSTANTIATE_TEST_SUITE_P(Schemes, Pictures, testing::Values(ColorScheme::kLight, ColorScheme::kDark));

}  // namespace
}  // namespace Desk
