// Texts on their way between the library and Qt. All texts may come from a server, so none is ever taken for
// markup.
#pragma once

#include <QtCore/QString>

#include "ostcore/Types.h"

namespace ZOClientQt {
namespace detail {

QString ToQt(const ostcore::U8String& inText);
ostcore::U8String FromQt(const QString& inText);
/// For tooltips, which Qt would otherwise take for HTML when they look like it. Long ones are wrapped.
QString ToTip(const ostcore::U8String& inText);
/// Without the marks with which Qt means a mnemonic.
QString EscapeMnemonics(QString inText);
/// The same text with places at which a very long word may be broken.
QString BreakLongWords(const QString& inText);
/// What a label calls the control beside it; the colon is for the eye.
QString NameFromLabel(QString inLabel);
/// For the title of a window, in which "[*]" means something to Qt.
QString ToTitle(const ostcore::U8String& inText);

}  // namespace detail
}  // namespace ZOClientQt
