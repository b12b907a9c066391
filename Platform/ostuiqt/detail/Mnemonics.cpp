// The choice of letters.
#include "ostuiqt/detail/Mnemonics.h"

#include <QtCore/QSet>

#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {
namespace {

constexpr qsizetype kNone = -1;

bool BeginsWord(const QString& inText, qsizetype inAt) {
    return inAt == 0 || !inText[inAt - 1].isLetterOrNumber();
}

qsizetype FindFreeLetter(const QString& inText, const QSet<QChar>& inTaken, bool inOnlyFirst) {
    for (qsizetype at = 0; at < inText.size(); ++at) {
        const QChar letter = inText[at];
        if (letter.isLetterOrNumber() && !inTaken.contains(letter.toCaseFolded()) &&
            (!inOnlyFirst || BeginsWord(inText, at))) {
            return at;
        }
    }
    return kNone;
}

QString Mark(const QString& inText, qsizetype inAt) {
    return inAt == kNone
               ? EscapeMnemonics(inText)
               : EscapeMnemonics(inText.left(inAt)) + QLatin1Char('&') + EscapeMnemonics(inText.mid(inAt));
}

}  // namespace

std::vector<QString> AssignMnemonics(const std::vector<QString>& inCaptions) {
    std::vector<qsizetype> letters(inCaptions.size(), kNone);
    QSet<QChar> taken;
    for (const bool onlyFirst : {true, false}) {
        for (std::size_t which = 0; which < inCaptions.size(); ++which) {
            if (letters[which] != kNone) {
                continue;
            }
            letters[which] = FindFreeLetter(inCaptions[which], taken, onlyFirst);
            if (letters[which] != kNone) {
                taken.insert(inCaptions[which][letters[which]].toCaseFolded());
            }
        }
    }
    std::vector<QString> marked;
    for (std::size_t which = 0; which < inCaptions.size(); ++which) {
        marked.push_back(Mark(inCaptions[which], letters[which]));
    }
    return marked;
}

}  // namespace detail
}  // namespace ZOClientQt
