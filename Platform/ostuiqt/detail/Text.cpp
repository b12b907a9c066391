// Texts between the library and Qt.
#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

QString ToQt(const ostcore::U8String& inText) {
    return QString::fromUtf8(inText.data(), static_cast<qsizetype>(inText.size()));
}

ostcore::U8String FromQt(const QString& inText) {
    QByteArray bytes = inText.toUtf8();
    ostcore::U8String text(bytes.constData(), static_cast<std::size_t>(bytes.size()));
    // It may have been a password.
    bytes.fill('\0');
    return text;
}

QString ToTip(const ostcore::U8String& inText) {
    if (inText.empty()) {
        return {};
    }
    QString text = ToQt(inText).toHtmlEscaped();
    text.replace(QLatin1Char('\n'), QLatin1String("<br>"));
    return QLatin1String("<qt>") + text + QLatin1String("</qt>");
}

QString EscapeMnemonics(QString inText) {
    return inText.replace(QLatin1Char('&'), QLatin1String("&&"));
}

QString BreakLongWords(const QString& inText) {
    constexpr int kLongest = 32;
    constexpr char16_t kMayBreak = 0x200B;
    QString broken;
    broken.reserve(inText.size());
    int length = 0;
    for (const QChar letter : inText) {
        if (letter.isSpace()) {
            length = 0;
        } else if (++length > kLongest && !letter.isLowSurrogate() && !letter.isMark()) {
            broken += QChar(kMayBreak);
            length = 1;
        }
        broken += letter;
    }
    return broken;
}

QString NameFromLabel(QString inLabel) {
    while (inLabel.endsWith(QLatin1Char(':')) || inLabel.endsWith(QLatin1Char(' '))) {
        inLabel.chop(1);
    }
    return inLabel;
}

QString ToTitle(const ostcore::U8String& inText) {
    return ToQt(inText).replace(QLatin1String("[*]"), QLatin1String("[*][*]"));
}

}  // namespace detail
}  // namespace ZOClientQt
