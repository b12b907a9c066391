// Runs the XML parser over a packet, with all that is foreign kept in bounds, and checks the wrapper.
#include "OrvaneXMP/PacketReader.h"

#include <expat.h>

#include <algorithm>
#include <memory>
#include <new>
#include <stdexcept>

#include "OrvaneXMP/detail/ParserMemory.h"
#include "OrvaneXMP/detail/QualifiedNames.h"
#include "OrvaneXMP/detail/RdfBuilder.h"
#include "OrvaneXMP/detail/Unicode.h"

namespace OrvaneXMP {

namespace {

constexpr std::size_t kLargestTag = 1u << 20;
/// A tag that is cut by the end of a piece is looked at again with the next one, so pieces are large.
constexpr std::size_t kPieceSize = 256u << 10;

ReadResult Refused(std::string inReason, std::size_t inLine, std::size_t inColumn) {
    ReadResult result;
    result.failure = {std::move(inReason), inLine, inColumn};
    return result;
}

/// The two processing instructions around a packet.
class Wrapper {
public:
    void Instruction(std::string_view inData, bool inIsBeforeRoot) {
        if (StartsWith(inData, "begin=")) {
            if (mIsBegun || !inIsBeforeRoot) {
                throw Refusal{"a packet wrapper begins inside of a packet"};
            }
            mIsBegun = true;
        } else if (IsOneOf(inData, {"end=\"w\"", "end='w'", "end=\"r\"", "end='r'"})) {
            if (!mIsBegun || mIsEnded || inIsBeforeRoot) {
                throw Refusal{"a packet wrapper ends where none has begun"};
            }
            mIsEnded = true;
        } else {
            throw Refusal{"a packet wrapper neither begins nor ends"};
        }
    }
    bool IsOpen() const noexcept { return mIsBegun && !mIsEnded; }

private:
    static bool StartsWith(std::string_view inText, std::string_view inHead) {
        return inText.substr(0, inHead.size()) == inHead;
    }
    static bool IsOneOf(std::string_view inData, std::initializer_list<std::string_view> inForms) {
        const std::string_view trimmed = inData.substr(0, inData.find_last_not_of(" \t\r\n") + 1);
        return std::find(inForms.begin(), inForms.end(), trimmed) != inForms.end();
    }

    bool mIsBegun = false;
    bool mIsEnded = false;
};

/// One run of the parser. An exception must not go through the frames of the parser, which is C: each event
/// keeps its own and stops the run.
class Run {
public:
    /// Who resolves prefixes. The parser does it for each name anew, and with the last word on what is
    /// allowed; a run with prefixes resolved here is quicker, and what it refuses is for the parser to judge.
    enum class Prefixes { ByParser, Here };

    Run(const char* inEncoding, Prefixes inPrefixes)
        : mParser(MakeParser(inEncoding, inPrefixes), &XML_ParserFree) {
        if (!mParser) {
            throw std::bad_alloc();
        }
        XML_SetUserData(mParser.get(), this);
        XML_SetCharacterDataHandler(mParser.get(), &OnCharacters);
        XML_SetStartDoctypeDeclHandler(mParser.get(), &OnDoctype);
        if (inPrefixes == Prefixes::ByParser) {
            XML_SetElementHandler(mParser.get(), &OnStart, &OnEnd);
            XML_SetProcessingInstructionHandler(mParser.get(), &OnInstruction);
            XML_SetStartNamespaceDeclHandler(mParser.get(), &OnPrefix);
        } else {
            XML_SetElementHandler(mParser.get(), &OnQualifiedStart, &OnQualifiedEnd);
            XML_SetProcessingInstructionHandler(mParser.get(), &OnQualifiedInstruction);
        }
    }

    ReadResult Read(std::string_view inText) {
        if (!Feed(inText)) {
            if (mIsOutOfMemory) {
                throw std::bad_alloc();
            }
            return mIsStopped ? Refused(std::move(mReason), mLine, mColumn)
                              : RefusedHere(XML_ErrorString(XML_GetErrorCode(mParser.get())));
        }
        if (mWrapper.IsOpen()) {
            return RefusedHere("the packet wrapper is not ended");
        }
        ReadResult result;
        result.packet = mBuilder.Take();
        return result;
    }

private:
    static XML_Parser MakeParser(const char* inEncoding, Prefixes inPrefixes) {
        return inPrefixes == Prefixes::ByParser
                   ? XML_ParserCreate_MM(inEncoding, &BoundedParserMemory(), " ")
                   : XML_ParserCreate_MM(inEncoding, &HalfOfParserMemory(), nullptr);
    }

    bool Feed(std::string_view inText) {
        const std::size_t pieceSize = inText.size() <= kLargestTag ? inText.size() : kPieceSize;
        std::size_t fed = 0;
        do {
            const std::string_view piece = inText.substr(fed, pieceSize);
            fed += piece.size();
            const int isLast = fed == inText.size() ? 1 : 0;
            if (XML_Parse(mParser.get(), piece.data(), static_cast<int>(piece.size()), isLast) !=
                XML_STATUS_OK) {
                return false;
            }
            const auto tokenStart = XML_GetCurrentByteIndex(mParser.get());
            if (tokenStart >= 0 && fed - static_cast<std::size_t>(tokenStart) > kLargestTag + kPieceSize) {
                Stop("a tag is too large");
                return false;
            }
        } while (fed < inText.size());
        return true;
    }

    ReadResult RefusedHere(const char* inReason) const {
        return Refused(inReason, XML_GetCurrentLineNumber(mParser.get()),
                       XML_GetCurrentColumnNumber(mParser.get()) + 1);
    }

    void Stop(std::string inReason) {
        mIsStopped = true;
        mReason = std::move(inReason);
        mLine = XML_GetCurrentLineNumber(mParser.get());
        mColumn = XML_GetCurrentColumnNumber(mParser.get()) + 1;
        XML_StopParser(mParser.get(), XML_FALSE);
    }

    void StartQualified(const XML_Char* inName, const XML_Char** inAttributes) {
        mNames.Open();
        mAttributes.clear();
        for (const XML_Char** at = inAttributes; *at; at += 2) {
            const bool isDeclaration = at[0][0] == 'x' && QualifiedNames::IsDeclaration(at[0]);
            if (isDeclaration) {
                mBuilder.DeclarePrefix(mNames.Declare(at[0], at[1]), at[1]);
            } else {
                mAttributes.push_back({nullptr, at[0], at[1]});
            }
        }
        for (Attribute& attribute : mAttributes) {
            attribute.known = &mNames.OfAttribute(attribute.name);
        }
        mBuilder.StartElement(mNames.OfElement(inName), mAttributes);
    }

    /// The parser may still tell of events after it was stopped.
    template <class F>
    static void Guarded(void* inSelf, const F& inBody) {
        Run& self = *static_cast<Run*>(inSelf);
        if (self.mIsStopped) {
            return;
        }
        try {
            inBody(self);
        } catch (const Refusal& refusal) {
            self.Stop(refusal.reason);
        } catch (const std::length_error&) {
            self.Stop("the nodes are nested too deep");
        } catch (const std::invalid_argument&) {
            self.Stop("a value has qualifiers that it cannot have");
        } catch (const std::bad_alloc&) {
            self.mIsOutOfMemory = true;
            self.Stop({});
        }
    }

    static void OnStart(void* inSelf, const XML_Char* inName, const XML_Char** inAttributes) {
        Guarded(inSelf, [&](Run& ioRun) {
            ioRun.mHasRoot = true;
            ioRun.mAttributes.clear();
            for (const XML_Char** at = inAttributes; *at; at += 2) {
                ioRun.mAttributes.push_back({nullptr, at[0], at[1]});
            }
            ioRun.mBuilder.StartElement(ioRun.mTerms.OfElement(inName), ioRun.mAttributes);
        });
    }
    static void OnQualifiedStart(void* inSelf, const XML_Char* inName, const XML_Char** inAttributes) {
        Guarded(inSelf, [&](Run& ioRun) {
            ioRun.mHasRoot = true;
            ioRun.StartQualified(inName, inAttributes);
        });
    }
    static void OnQualifiedEnd(void* inSelf, const XML_Char*) {
        Guarded(inSelf, [](Run& ioRun) {
            ioRun.mBuilder.EndElement();
            ioRun.mNames.Close();
        });
    }
    static void OnQualifiedInstruction(void* inSelf, const XML_Char* inTarget, const XML_Char* inData) {
        if (std::string_view(inTarget).find(':') == std::string_view::npos) {
            return OnInstruction(inSelf, inTarget, inData);
        }
        Guarded(inSelf, [](Run&) { throw Refusal{"the target of an instruction has a colon"}; });
    }
    static void OnEnd(void* inSelf, const XML_Char*) {
        Guarded(inSelf, [](Run& ioRun) { ioRun.mBuilder.EndElement(); });
    }
    static void OnCharacters(void* inSelf, const XML_Char* inText, int inSize) {
        Guarded(inSelf, [&](Run& ioRun) {
            ioRun.mBuilder.Characters({inText, static_cast<std::size_t>(inSize)});
        });
    }
    static void OnInstruction(void* inSelf, const XML_Char* inTarget, const XML_Char* inData) {
        Guarded(inSelf, [&](Run& ioRun) {
            if (std::string_view(inTarget) != "xpacket") {
                return;
            }
            if (ioRun.mBuilder.IsInside()) {
                throw Refusal{"a packet wrapper begins or ends inside of a packet"};
            }
            ioRun.mWrapper.Instruction(inData, !ioRun.mHasRoot);
        });
    }
    static void OnPrefix(void* inSelf, const XML_Char* inPrefix, const XML_Char* inURI) {
        Guarded(inSelf, [&](Run& ioRun) {
            ioRun.mBuilder.DeclarePrefix(inPrefix ? inPrefix : "", inURI ? inURI : "");
        });
    }
    static void OnDoctype(void* inSelf, const XML_Char*, const XML_Char*, const XML_Char*, int) {
        Guarded(inSelf, [](Run&) { throw Refusal{"a document type declaration is no part of XMP"}; });
    }

    std::unique_ptr<XML_ParserStruct, decltype(&XML_ParserFree)> mParser;
    Terms mTerms;
    QualifiedNames mNames{mTerms};
    RdfBuilder mBuilder{mTerms};
    std::vector<Attribute> mAttributes;
    Wrapper mWrapper;
    bool mHasRoot = false;
    bool mIsStopped = false;
    bool mIsOutOfMemory = false;
    std::string mReason;
    std::size_t mLine = 0;
    std::size_t mColumn = 0;
};

ReadResult ReadText(std::string_view inText, const char* inEncoding) {
    ReadResult quick = Run(inEncoding, Run::Prefixes::Here).Read(inText);
    return quick ? std::move(quick) : Run(inEncoding, Run::Prefixes::ByParser).Read(inText);
}

}  // namespace

std::string ReadFailure::Text() const {
    return line == 0 ? reason
                     : "line " + std::to_string(line) + ", column " + std::to_string(column) + ": " + reason;
}

ReadResult ReadPacket(std::string_view inBytes) {
    const TextForm form = FindTextForm(inBytes);
    if (form == TextForm::EightBit) {
        return inBytes.size() > kMaximumPacketSize ? Refused("the packet is too large", 0, 0)
                                                   : ReadText(inBytes, nullptr);
    }
    std::string text;
    if (inBytes.size() > 4 * kMaximumPacketSize || !ConvertToUTF8(inBytes, form, text) ||
        text.size() > kMaximumPacketSize) {
        return Refused("the packet is too large, or no well-formed UTF-16 or UTF-32", 0, 0);
    }
    return ReadText(text, "UTF-8");
}

}  // namespace OrvaneXMP
