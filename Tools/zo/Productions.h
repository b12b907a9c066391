// Finds and loads productions for the verbs.
#pragma once

#include <string>
#include <vector>

#include "Context.h"

namespace zo {

/// Loads a resource; throws a Failure that begins with what was tried.
void LoadResource(Context& ioContext, const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource,
                  const std::string& inWhat);

template <class T>
void LoadResource(Context& ioContext, const ZOCL::InterfaceRef<T>& inObject, const std::string& inWhat) {
    LoadResource(ioContext, RFL::QueryInterface<ZOCL::IZOCServerResource>(inObject), inWhat);
}

enum class ListKind { Productions, Templates };

/// All pages of a list.
std::vector<ZOCL::IZOCProductionList::Entry> ListProductions(Context& ioContext, ListKind inKind);

/// A loaded production.
struct LoadedProduction {
    ZOCL::InterfaceRef<ZOCL::IZOCProduction> production;
    std::string id;
    std::string name;
    std::string commit;
    std::string url;
};

/// Throws a Failure (usage) for a text that cannot be a commit.
void CheckIsCommit(const std::string& inText);

/// Of a production, session or transaction that is loaded.
LoadedProduction DescribeProduction(const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction);

/// By exact name, identifier or URL; an empty commit stands for the newest.
LoadedProduction LoadProduction(Context& ioContext, const std::string& inWhich, const std::string& inCommit);
LoadedProduction LoadProductionAt(Context& ioContext, const std::string& inID, const std::string& inCommit);
/// The production that this user opened, at the commit it was opened at.
LoadedProduction LoadOpenProduction(Context& ioContext);
/// Follows the latest-version link. Null production when there is no such link.
LoadedProduction LoadLatestVersion(Context& ioContext, const LoadedProduction& inProduction);

/// Remembers a production as the open one of the connected user.
void RememberOpen(Context& ioContext, const LoadedProduction& inProduction);

}  // namespace zo
