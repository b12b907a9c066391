// As one writes it at first: an element owns its strings and its children.
#include "StringTree.h"

#include <expat.h>

namespace {

struct Builder {
    std::unique_ptr<StringElement> root;
    std::vector<StringElement*> open;
};

void OnStart(void* inBuilder, const XML_Char* inName, const XML_Char** inAttributes) {
    Builder& builder = *static_cast<Builder*>(inBuilder);
    auto element = std::make_unique<StringElement>();
    element->name = inName;
    for (const XML_Char** at = inAttributes; *at; at += 2) {
        element->attributes.emplace_back(at[0], at[1]);
    }
    StringElement* const added = element.get();
    if (builder.open.empty()) {
        builder.root = std::move(element);
    } else {
        builder.open.back()->children.push_back(std::move(element));
    }
    builder.open.push_back(added);
}

void OnEnd(void* inBuilder, const XML_Char*) {
    static_cast<Builder*>(inBuilder)->open.pop_back();
}

void OnCharacters(void* inBuilder, const XML_Char* inText, int inSize) {
    static_cast<Builder*>(inBuilder)->open.back()->text.append(inText, static_cast<std::size_t>(inSize));
}

}  // namespace

std::unique_ptr<StringElement> ParseToStrings(std::string_view inText) {
    const std::unique_ptr<XML_ParserStruct, decltype(&XML_ParserFree)> parser(
        XML_ParserCreateNS(nullptr, ' '), &XML_ParserFree);
    Builder builder;
    XML_SetUserData(parser.get(), &builder);
    XML_SetElementHandler(parser.get(), &OnStart, &OnEnd);
    XML_SetCharacterDataHandler(parser.get(), &OnCharacters);
    const bool isParsed =
        XML_Parse(parser.get(), inText.data(), static_cast<int>(inText.size()), XML_TRUE) == XML_STATUS_OK;
    return isParsed ? std::move(builder.root) : nullptr;
}
