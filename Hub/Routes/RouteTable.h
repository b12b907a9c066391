// The routes of each resource; together they are the hub's protocol.
#pragma once

#include "Model/Sessions.h"
#include "Routes/Hub.h"

namespace zohub {

void AddSystemRoutes(std::vector<Route>& ioRoutes);
void AddProductionRoutes(std::vector<Route>& ioRoutes);
void AddAssetRoutes(std::vector<Route>& ioRoutes);
void AddEnclosureRoutes(std::vector<Route>& ioRoutes);
void AddRenditionRoutes(std::vector<Route>& ioRoutes);
void AddLocatorRoutes(std::vector<Route>& ioRoutes);
void AddSessionRoutes(std::vector<Route>& ioRoutes);
void AddTransactionRoutes(std::vector<Route>& ioRoutes);
void AddBulkRoutes(std::vector<Route>& ioRoutes);
void AddHistoryRoutes(std::vector<Route>& ioRoutes);
void AddDifferenceRoutes(std::vector<Route>& ioRoutes);
void AddAcceptRoutes(std::vector<Route>& ioRoutes);

/// POST of the sign-in form. Its own transactions: the password is checked outside of them.
Response SignInByForm(Request const& inRequest, Storage& inStorage, HubSettings const& inSettings,
                      Micros inNow);

/// Opens the line of the first parameter. With inIsPinned the second one is a commit.
View OpenView(Call& ioCall, bool inIsPinned);

/// As OpenView, live, and of a line that the actor may write to.
View OpenForWriting(Call& ioCall);

/// Throws Failure 403 when the actor may not write to the line, 409 when nobody may any more.
void RequireWritable(View const& inView);

/// As OpenView, live: the actor's own session, with an If-Match of the request looked at. Throws Failure 404
/// for another line, 403 for another user, 412.
View OpenSession(Call& ioCall);

/// As OpenView, live: an open transaction of the actor's own, with an If-Match of the request looked at.
/// Throws Failure 404 for another line, 403 for another user, 409 for one that has ended, 412.
View OpenTransaction(Call& ioCall);

/// Throws Failure 403 unless the session is the actor's own.
void RequireManager(View const& inSession);

/// The document of a production, session or transaction; with status 201 its address as well.
Response LineResponse(Call& ioCall, View const& inView, int inStatus);

/// Throws Failure 400 for an unknown strategy.
ResolveStrategy ReadResolveStrategy(std::string const& inText);

/// The text as it came, byte for byte. Throws Failure 413 when it is too long for a commit.
std::string CheckedMessage(std::string inText);

}  // namespace zohub
