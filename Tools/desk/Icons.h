// Icons by name, drawn from SVG at the size, resolution and colours of where they stand.
#pragma once

#include <QtGui/QIcon>

namespace Desk {

/// One of the library's icons ("SP_Folder_Sm"; ZOClient/Library.h) or of the desk's own ("Share", "Latest",
/// "Resolve", "History", "Save", "Refresh", "Enclosure", "Picture"). Null when there is none. Main thread.
QIcon GetIcon(const char* inName);
/// Of an asset, by its type.
QIcon GetAssetIcon(const std::string& inAssetType);

}  // namespace Desk
