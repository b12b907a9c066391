// The language of layouts: what reads, what is refused and how that is told; windows made of it; the page
// that describes it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <map>

#include "ostcore/threads/MainThread.h"
#include "ostlyra/Layout.h"
#include "ostlyra/Tags.h"
#include "ostlyra/UI_Lyra.h"

namespace ostlyra {
namespace {

using ostcore::utility::BinaryEntry;
using testing::ElementsAre;
using testing::HasSubstr;

using Texts = std::map<std::string, std::string>;

LayoutSource SourceOf(const Texts& inTexts) {
    return [inTexts](const std::string& inName) {
        const auto found = inTexts.find(inName);
        return found == inTexts.end() ? optional<std::string>() : optional<std::string>(found->second);
    };
}

std::string ErrorOf(const std::string& inText, const Texts& inOthers = {}) {
    LayoutError error;
    return ParseLayout(inText, error, SourceOf(inOthers)) ? "is a layout" : error.AsText();
}

/// In a window without more ado, on the first line from column 29 on.
std::string Window(const std::string& inViews) {
    return "layout A { view ost_dialog {" + inViews + "}}";
}

TEST(Layout, IsATreeOfViewsWithTheirPlaces) {
    LayoutError error;
    const auto layout = ParseLayout(
        "\xEF\xBB\xBF// a window\r\nlayout A {\r\n\tview ost_dialog(name: \"$$$/A/T=\\\"T\\\"\" /* two */ "
        "'\\n\\t\\\\\\'\xC3\xA4', "
        "canResize: true,) {\n  row { ost_button(identifier: 'x'); ost_text_edit(minWidth: 250); } } }",
        error);
    ASSERT_TRUE(layout) << error.AsText();
    EXPECT_EQ(layout->name, "A");
    EXPECT_EQ(*layout->view.Find("name"), "$$$/A/T=\"T\"\n\t\\'\xC3\xA4");
    EXPECT_TRUE(layout->view.GetFlag("canResize", false));
    ASSERT_EQ(layout->view.children.size(), 1u);
    const ostui::View& row = layout->view.children[0];
    EXPECT_TRUE(row.GetIdentifier().empty());
    ASSERT_EQ(row.children.size(), 2u);
    EXPECT_EQ(row.children[0].GetIdentifier(), "x");
    EXPECT_EQ(row.children[1].GetIdentifier(), "#1");
    EXPECT_EQ(row.children[1].GetNumber("minWidth", 0), 250);
    EXPECT_EQ(std::make_pair(row.children[1].line, row.children[1].column), std::make_pair(4, 38));
}

TEST(Layout, RefusesWhatIsNoneAndSaysWhere) {
    const std::string deep = [] {
        std::string text;
        for (int i = 0; i < 100000; ++i) {
            text += "row{";
        }
        return text;
    }();
    const std::pair<std::string, std::string> cases[] = {
        {"", "layout:1:1: expected 'layout', found the end"},
        {"Layout A", "layout:1:1: expected 'layout', found 'Layout'"},
        {"layout A { view row; }", "A:1:17: expected 'ost_dialog' or 'ost_tab_view', found 'row'"},
        {"layout A { view ost_dialog; } x", "A:1:31: expected the end after the layout, found 'x'"},
        {"layout A {\n view ost_dialog {\n  column {\n",
         "A:4:1: expected a tag, or '}' to close 'column' of line 3, found the end"},
        {Window("ost_buton();"), "A:1:29: unknown tag 'ost_buton'"},
        {Window("ost_button(nmae: 'x');"),
         "A:1:40: 'ost_button' has no parameter 'nmae'; it has 'identifier', "},
        {Window("ost_button(name: 'x' tooltip: 'y');"), "A:1:50: expected ',' or ')' after a parameter"},
        {Window("ost_button(name: 'x', name: 'y');"), "A:1:51: the parameter 'name' stands twice"},
        {Window("ost_button(name: x);"), "A:1:46: expected a quoted text for 'name', found 'x'"},
        {Window("ost_button(name: '$$$/A/B');"), "expected '=' and the English text after the key"},
        {Window("ost_button(minWidth: 12px);"), "'minWidth', found the number 12px"},
        {Window("ost_button(minWidth: 10001);"), "expected a number from 0 to 10000"},
        {Window("ost_button(minWidth: -1);"), "A:1:50: unexpected '-'"},
        {Window("row(placement: left);"),
         "expected 'column', 'row' or 'overlay' for 'placement', found 'left'"},
        {Window("ost_button(identifier: '#1');"), "expected a name of letters, digits and '_'"},
        {Window("ost_static_image(image: '../../etc/passwd');"),
         "expected a name of letters, digits and '_'"},
        {Window("ost_static_image(image: '%2e%2e');"), "expected a name of letters, digits and '_'"},
        {Window("ost_tab_container { ost_layout_script(identifier: '/etc/passwd'); }"),
         "expected a name of letters, digits and '_'"},
        {Window("ost_tab_container { ost_layout_script(identifier: '" + std::string(255, 'a') + "'); }"),
         "there is no layout 'a"},
        {Window("ost_text_edit(password: yes);"), "expected 'true' or 'false' for 'password', found 'yes'"},
        {Window("ost_button()"), "A:1:41: expected ';' after 'ost_button', which holds no views, found '}'"},
        {Window("row()"), "expected ';' or '{' after 'row', found '}'"},
        {Window("ost_static_image;"), "'ost_static_image' must have the parameter 'image'"},
        {Window("ost_dialog;"), "'ost_dialog' stands at the top of a window's layout only"},
        {Window("ost_popup { ost_button; }"), "'ost_button' stands not in 'ost_popup'"},
        {Window("ost_tab_view(name: '');"), "'ost_tab_view' stands in 'ost_tab_container' only"},
        {Window("ost_radio_button(identifier: a, name: '');"), "stands in 'ost_radio_button_group' only"},
        {Window("ost_radio_button_group { row { ost_radio_button_group; } }"),
         "stands not inside another one"},
        {Window("row(identifier: a);\nost_button(identifier: a);"),
         "A:2:1: the identifier 'a' stands already at A:1"},
        {Window("ost_cancel_row; ost_button(identifier: cancelButton);"), "'cancelButton' stands already"},
        {Window("ost_button(name: 'x);"), "A:1:46: expected ' before the end of the line"},
        {Window("ost_button(name: '\\q');"), "A:1:47: expected \\\", \\', \\\\, \\n or \\t"},
        {Window("ost_button(name: 'x\x01');"), "A:1:48: found a control character"},
        {Window("/* \xC3\xA4\xC3( */"), "A:1:33: expected UTF-8"},
        {Window("/* /"), "A:1:29: expected '*/'"},
        {Window("#additional_tabs#"), "A:1:29: unexpected '#'"},
        {std::string("layout A {\0", 11), "A:1:11: found a control character"},
        {Window(deep), "views are nested more than 64 deep"},
        {std::string(1024 * 1024 + 1, ' '), "larger than 1048576 bytes"},
    };
    for (const auto& [text, error] : cases) {
        EXPECT_THAT(ErrorOf(text), HasSubstr(error)) << text.substr(0, 200);
    }
}

TEST(Layout, PullsInOthersOnceEach) {
    const std::string window = Window("ost_tab_container { ost_layout_script(identifier: 'B'); }");
    LayoutError error;
    const auto layout = ParseLayout(
        window, error, SourceOf({{"B", "layout B { view ost_tab_view(name: 'b') { ost_button; } }"}}));
    ASSERT_TRUE(layout) << error.AsText();
    const ostui::View& page = layout->view.children[0].children[0];
    EXPECT_EQ(page.tag, "ost_tab_view");
    EXPECT_EQ(page.children[0].GetIdentifier(), "#3");

    const auto page_with = [](const std::string& inViews) {
        return "layout B { view ost_tab_view(name: 'b') {" + inViews + "}}";
    };
    EXPECT_EQ(ErrorOf(window), "A:1:49: there is no layout 'B'");
    EXPECT_EQ(ErrorOf(window, {{"B", "layout C {"}}), "B:1:8: expected the name 'B', found 'C'");
    EXPECT_EQ(ErrorOf(window, {{"B", "layout B { view ost_dialog; }"}}),
              "B:1:17: 'ost_dialog' stands at the top of a window's layout only");
    for (const std::string name : {"A", "B"}) {
        EXPECT_THAT(
            ErrorOf(window,
                    {{"B", page_with("ost_tab_container { ost_layout_script(identifier: " + name + "); }")}}),
            HasSubstr("the layout '" + name + "' pulls in itself"));
    }
    EXPECT_EQ(ErrorOf(Window("ost_button(identifier: x);\nost_tab_container {"
                             " ost_layout_script(identifier: B); }"),
                      {{"B", page_with("\n ost_button(identifier: x);")}}),
              "B:2:2: the identifier 'x' stands already at A:1");
    const std::string half(600 * 1024, ' ');
    EXPECT_THAT(ErrorOf(window + half, {{"B", page_with(half)}}), HasSubstr("all together are larger"));
}

/// Gives another text for one of the layouts, as a window with additional pages does.
class WindowWithPages final : public UI_Lyra {
public:
    using UI_Lyra::UI_Lyra;
    BinaryResource GetLayoutStream(const std::string& inName) const override {
        BinaryResource stream = UI_Lyra::GetLayoutStream(inName);
        const std::string text(stream.View());
        const std::size_t mark = text.find("#pages#");
        return mark == std::string::npos ? stream
                                         : ostcore::utility::MakeBinaryResource(text.substr(0, mark) + pages +
                                                                                text.substr(mark + 7));
    }
    std::string pages;
};

BinaryEntry EntryOf(const char* inType, const char* inName, std::string_view inText) {
    return {inType, inName, reinterpret_cast<const unsigned char*>(inText.data()), inText.size()};
}

TEST(UILyra, MakesADialogOfALayoutAndItsPages) {
    ostcore::threads::SetMainThread();
    const BinaryEntry entries[] = {
        EntryOf("SVG", "A", "<svg/>"),
        EntryOf("LYRA", "A",
                "layout A { view ost_dialog { ost_tab_container { #pages# } ost_ok_cancel_row; } }"),
        EntryOf("LYRA", "B", "layout B { view ost_tab_view(name: 'b', identifier: B); }"),
    };
    const BinaryModule module{entries, 3};
    WindowWithPages window("A", module);
    window.pages = "ost_layout_script(identifier: 'B'); ";
    EXPECT_THROW(window.GetDialog(), std::logic_error);
    ASSERT_TRUE(window.Initialize()) << window.GetLayoutError().AsText();
    EXPECT_EQ(window.GetDialog().GetID(), "A");
    EXPECT_NE(window.GetDialog().Find("B"), nullptr);
    window.GetDialog().Close(ostui::kResponseOK);
    EXPECT_EQ(window.RunModal(), ostui::kResponseOK);
    window.DoCancel();
    EXPECT_EQ(window.RunModal(), ostui::kResponseCancel);
    EXPECT_EQ(window.GetResponse(), ostui::kResponseCancel);

    window.pages = "nonsense";
    EXPECT_FALSE(window.Initialize());
    EXPECT_FALSE(window.HasDialog());
    EXPECT_EQ(window.GetLayoutError().AsText(), "A:1:50: unknown tag 'nonsense'");
    for (const std::string name : {"B", "C", "a"}) {
        UI_Lyra other(name, module);
        EXPECT_FALSE(other.Initialize()) << name;
        EXPECT_EQ(other.RunModal(), ostui::kResponseNone);
    }

    EXPECT_EQ(GetBinaryFromModule(module, "svg", "A").View(), "<svg/>");
    EXPECT_FALSE(GetBinaryFromModule(module, "SVG", "B"));
    EXPECT_THAT(GetBinaryNames(module, "lyra"), ElementsAre("A", "B"));
}

TEST(LayoutPage, NamesEachTagAndParameterAndShowsTrueExamples) {
    std::ifstream stream(ZO_LAYOUT_PAGE);
    const std::string page(std::istreambuf_iterator<char>(stream), {});
    for (const Tag& tag : GetTags()) {
        EXPECT_THAT(page, HasSubstr("| `" + std::string(tag.name) + "` |"));
        for (const TagParameter& parameter : tag.parameters) {
            EXPECT_THAT(page, HasSubstr("`" + std::string(parameter.name) + "`"));
        }
    }
    int examples = 0;
    for (std::size_t at = page.find("```\nlayout"); at != std::string::npos;
         at = page.find("```\nlayout", at + 1)) {
        const std::string example = page.substr(at + 4, page.find("```", at + 4) - at - 4);
        EXPECT_EQ(ErrorOf(example), "is a layout") << example;
        ++examples;
    }
    EXPECT_GE(examples, 2);
}

}  // namespace
}  // namespace ostlyra
