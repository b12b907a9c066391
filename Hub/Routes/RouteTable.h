// The routes of each resource; together they are the hub's protocol.
#pragma once

#include "Routes/Hub.h"

namespace zohub {

void AddSystemRoutes(std::vector<Route>& ioRoutes);
void AddProductionRoutes(std::vector<Route>& ioRoutes);
void AddAssetRoutes(std::vector<Route>& ioRoutes);
void AddEnclosureRoutes(std::vector<Route>& ioRoutes);
void AddRenditionRoutes(std::vector<Route>& ioRoutes);
void AddLocatorRoutes(std::vector<Route>& ioRoutes);

/// POST of the sign-in form. Its own transactions: the password is checked outside of them.
Response SignInByForm(Request const& inRequest, Storage& inStorage, HubSettings const& inSettings,
                      Micros inNow);

/// Opens the production of the first parameter. With inIsPinned the second one is a commit.
View OpenView(Call& ioCall, bool inIsPinned);

/// As OpenView, live, and fails with 403 when the actor may not write to it.
View OpenForWriting(Call& ioCall);

}  // namespace zohub
