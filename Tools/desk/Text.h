// Texts on their way between the library and Qt.
#pragma once

#include <QtCore/QString>
#include <QtCore/QStringList>

#include "ZOClient/Types.h"

namespace Desk {

/// A text for the user: "$$$/ZODesk/Path=English text @0", in the language that the desk was started in.
QString Text(const char* inKeyAndText, const QStringList& inArguments = {});

/// Why something did not work, in a user's words.
QString DescribeResult(int inResult);

/// What does not fit on one line, and a text that Qt could take for markup, are made harmless.
QString ToTip(const QString& inText);

inline QString ToQt(const ZOCL::UString& inText) {
    return QString::fromStdU16String(inText);
}
inline QString ToQt(const ZOCL::ImmutableString& inText) {
    return QString::fromStdString(inText.str());
}
inline ZOCL::UString FromQt(const QString& inText) {
    return inText.toStdU16String();
}
inline ZOCL::ImmutableString ToID(const QString& inText) {
    return ZOCL::ImmutableString(inText.toStdString());
}

}  // namespace Desk
