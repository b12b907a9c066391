// Signing in, opening, looking and editing.
#include "DeskTest.h"

namespace Desk {
namespace {

using testing::HasSubstr;
using testing::Not;

TEST_F(DeskTest, AsksForALoginTellsWhatIsWrongWithItAndKeepsAGoodOne) {
    StartDesk();
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
    QDialog& window = *FindTop<QDialog>("signInWindow");
    EXPECT_EQ(Find<QLineEdit>(window, "user")->text(), QStringLiteral("anna"));
    EXPECT_FALSE(Find<QCheckBox>(window, "secure")->isChecked());

    auto* const message = Find<QLabel>(window, "message");
    Click(Find(window, "signIn"));
    EXPECT_EQ(message->text(), QStringLiteral("Please enter a value into every field."));
    QTest::keyClicks(Find<QLineEdit>(window, "password"), QStringLiteral("wrong"));
    QTest::keyClick(&window, Qt::Key_Return);
    EXPECT_TRUE(Find<QLineEdit>(window, "password")->text().isEmpty()) << "it stays in the window";
    WaitFor("the refusal",
            [&] { return message->text() == QStringLiteral("The user name or the password is not right."); });
    EXPECT_TRUE(message->isVisible());

    SignIn();
    WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });
    EXPECT_EQ(FindTop<QDialog>("signInWindow"), nullptr);

    // The next start needs no password, nor a server.
    host.reset();
    host = std::make_unique<Host>(StartOptions{{}, QStringLiteral("Harbour Film")});
    WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });

    // After signing out it does.
    Window().findChild<QAction*>(QStringLiteral("signOut"))->trigger();
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
    EXPECT_EQ(Tree().model()->rowCount(), 0);
    host.reset();
    host = std::make_unique<Host>(StartOptions{});
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
}

TEST_F(DeskTest, OpensWhatIsChosenOrTellsWhyNot) {
    StartDesk(QStringLiteral("No Such Film"));
    SignIn();
    auto* const text = Find<QLabel>(Window(), "messageText");
    WaitFor("the reason", [&] { return text->text().contains(QStringLiteral("\"No Such Film\"")); });
    EXPECT_FALSE(Window().findChild<QAction*>(QStringLiteral("share"))->isEnabled());

    WaitFor("the button", [this] { return FindButton(Window(), "Open Production...") != nullptr; });
    Click(FindButton(Window(), "Open Production..."));
    QDialog& chooser = *FindTop<QDialog>("productionWindow");
    auto* const list = Find<QTreeWidget>(chooser, "productions");
    WaitFor("the productions", [&] { return list->topLevelItemCount() == 1; });
    QTest::keyClicks(Find<QLineEdit>(chooser, "search"), QStringLiteral("nothing"));
    EXPECT_FALSE(Find(chooser, "open")->isEnabled());
    Type(Find<QLineEdit>(chooser, "search"), "harb");
    Click(Find(chooser, "open"));
    WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });
    EXPECT_THAT(Window().windowTitle().toStdString(), HasSubstr("Harbour Film"));
}

TEST_F(DeskTest, ShowsBinsBeforeClipsAndWhatLiesBelowThem) {
    OpenDesk();
    const QAbstractItemModel& model = *Tree().model();
    QStringList top;
    for (int row = 0; row < model.rowCount(); ++row) {
        top << model.index(row, 0).data().toString() + QLatin1Char(':') +
                   model.index(row, 1).data().toString();
    }
    EXPECT_EQ(top, QStringList({QStringLiteral("broll:Bin"), QStringLiteral("interviews:Bin"),
                                QStringLiteral("slate.png:MasterClip")}))
        << top.join(QLatin1Char(' ')).toStdString();
    const QModelIndex slate = model.index(2, 0);
    Tree().expand(slate);
    WaitFor("packet and picture", [&] { return model.rowCount(slate) == 2; });
    QStringList parts{model.index(0, 0, slate).data().toString(), model.index(1, 0, slate).data().toString()};
    parts.sort();
    EXPECT_EQ(parts, QStringList({QStringLiteral("Metadata"), QStringLiteral("image/png")}));

    Type(Find<QLineEdit>(Window(), "search"), "gulls");
    EXPECT_EQ(model.rowCount(), 1);
    EXPECT_EQ(model.rowCount(model.index(0, 0)), 1);
}

TEST_F(DeskTest, AnEditedFieldIsSavedInOneCommitThatAnotherClientSees) {
    OpenDesk();
    EditTitle("Slate of day two");
    auto* const save = Find(Window(), "metadataSave");
    EXPECT_TRUE(save->isEnabled());
    EXPECT_TRUE(Window().isWindowModified());
    Type(WaitForField("creator"), "Jonas Wieder; Grace Moor");
    Click(save);
    WaitForStatus("statusWork", "You have changes to share");
    WaitFor("the end of the edit", [&] { return !Window().isWindowModified(); });

    SignInZo();
    EXPECT_EQ(Zo({"session", "show"}).code, 0);
    const Ended packet = Zo({"xmp", "get", "slate.png"});
    EXPECT_EQ(packet.code, 0) << packet.text;
    EXPECT_THAT(packet.text, HasSubstr("Slate of day two"));
    EXPECT_THAT(packet.text, HasSubstr("<rdf:li>Grace Moor</rdf:li>"));
    // What the pane does not show has stayed.
    EXPECT_THAT(packet.text, HasSubstr("2026-03-15T06:30:00+01:00"));
    const Ended history = Zo({"history"});
    EXPECT_THAT(history.text, HasSubstr("Changed the metadata of slate.png"));
    EXPECT_THAT(Zo({"pending"}).text, HasSubstr("no transaction is open"));
    EXPECT_THAT(Zo({"xmp", "get", "slate.png", "--shared"}).text, Not(HasSubstr("day two")));
}

TEST_F(DeskTest, ChangesOfBothClientsMeetAndAClashIsToldAndNotWritten) {
    OpenDesk();
    SignInZo();
    EXPECT_EQ(Zo({"session", "show"}).code, 0);
    EditTitle("Mine");
    EditElsewhere("anna", "Slate of the second day.", "Theirs");
    Click(Find(Window(), "metadataSave"));
    WaitFor("the save", [&] { return !Window().isWindowModified(); });
    EXPECT_TRUE(Find<QLabel>(Window(), "metadataError")->text().isEmpty());
    const Ended merged = Zo({"xmp", "get", "slate.png"});
    EXPECT_THAT(merged.text, HasSubstr("Mine"));
    EXPECT_THAT(merged.text, HasSubstr("Theirs"));
    WaitFor("their text in the pane", [&] {
        const auto* const field = Window().findChild<QPlainTextEdit*>(QStringLiteral("description"));
        return field && field->toPlainText() == QStringLiteral("Theirs");
    });

    Type(WaitForField("title"), "Mine again");
    EditElsewhere("anna", "Mine", "Theirs too");
    Click(Find(Window(), "metadataSave"));
    auto* const error = Find<QLabel>(Window(), "metadataError");
    WaitFor("the clash",
            [&] { return error->text().startsWith(QStringLiteral("Somebody else has changed")); });
    EXPECT_TRUE(Window().isWindowModified()) << "the edit is lost";
    EXPECT_THAT(Zo({"xmp", "get", "slate.png"}).text, Not(HasSubstr("Mine again")));
    EXPECT_THAT(Zo({"pending"}).text, HasSubstr("no transaction is open"));
    Click(Find(Window(), "metadataRevert"));
    WaitFor("their title", [&] { return WaitForField("title")->text() == QStringLiteral("Theirs too"); });
}

TEST_F(DeskTest, UnsavedEditsAreAskedAboutBeforeTheyAreLeft) {
    OpenDesk();
    EditTitle("Not saved");
    const auto answer = [this](const char* inButton) {
        WaitFor("the question", [this] {
            return Window().findChild<QMessageBox*>(QStringLiteral("unsavedQuestion")) != nullptr;
        });
        auto* const question = Window().findChild<QMessageBox*>(QStringLiteral("unsavedQuestion"));
        QAbstractButton* const button = FindButton(*question, inButton);
        ASSERT_NE(button, nullptr) << inButton;
        Click(button);
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    };
    Window().close();
    answer("Cancel");
    EXPECT_TRUE(Window().isVisible());
    EXPECT_EQ(WaitForField("title")->text(), QStringLiteral("Not saved"));

    ChooseAsset("gulls");
    answer("Discard");
    auto* const heading = Find<QLabel>(Window(), "metadataHeading");
    WaitFor("the other asset", [&] { return heading->text().startsWith(QStringLiteral("gulls")); });

    EditTitle("Saved on the way out");
    Window().close();
    answer("Save");
    WaitFor("the end", [this] { return !Window().isVisible(); });
    SignInZo();
    EXPECT_EQ(Zo({"session", "show"}).code, 0);
    EXPECT_THAT(Zo({"xmp", "get", "slate.png"}).text, HasSubstr("Saved on the way out"));
}

}  // namespace
}  // namespace Desk
