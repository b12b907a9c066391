// Icons by name, drawn from SVG at the size and in the colours of where they stand.
#pragma once

#include <QtCore/QHash>
#include <QtGui/QIcon>

#include "ZOClientQt/QtBackEnd.h"

namespace ZOClientQt {
namespace detail {

/// Main thread only.
class Icons {
public:
    explicit Icons(const IconSource& inSource) : mSource(inSource) {}

    /// A null icon when there is none of that name, or its bytes are no SVG.
    QIcon Get(const std::string& inName);
    /// Of our own, in every window.
    static QIcon Search();

private:
    const IconSource mSource;
    QHash<QByteArray, QIcon> mIcons;
};

/// The size that the SVG names; 16 by 16 for a null icon.
QSize GetNaturalSize(const QIcon& inIcon);

}  // namespace detail
}  // namespace ZOClientQt
