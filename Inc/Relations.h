// The vocabulary of link relations, which the server shares: every relation stands here once.
#pragma once

#include "ZOClient/Types.h"

// X(constant, path behind kRelationBase)
#define ZOCL_RELATION_TABLE(X)                                                                           \
    X(kRelation_Discovery_V1, "/discovery/v1")                                                           \
    X(kRelation_System_Login, "/system/login")                                                           \
    X(kRelation_System_Logout, "/system/logout")                                                         \
    X(kRelation_Users_User_Current, "/users/user#current")                                               \
    X(kRelation_Users_User_Create, "/users/user#create")                                                 \
    X(kRelation_Users, "/users")                                                                         \
    X(kRelation_Groups, "/groups")                                                                       \
    X(kRelation_RenderNodes, "/rendernodes")                                                             \
    X(kRelation_Productions, "/productions")                                                             \
    X(kRelation_Productions_Templates, "/productions/templates")                                         \
    X(kRelation_Productions_Production_ByIdAndCommitId, "/productions/production#byIdAndCommitId")       \
    X(kRelation_Productions_Production_DifferenceByCommit, "/productions/production#differenceByCommit") \
    X(kRelation_Enclosures, "/enclosures")                                                               \
    X(kRelation_Settings, "/settings")                                                                   \
    X(kRelation_ExportPresets, "/exportpresets")                                                         \
    X(kRelation_Activities, "/activities")                                                               \
    X(kRelation_Monitors, "/monitors")                                                                   \
    X(kRelation_Monitors_Statistic_Add, "/monitors/statistic#add")                                       \
    X(kRelation_Monitors_External_Edit, "/monitors/external#edit")                                       \
    X(kRelation_MediaLocators, "/medialocators")                                                         \
    X(kRelation_MediaLocator_ByMediaLocatorId, "/medialocator#byMediaLocatorId")                         \
    X(kRelation_Jobs, "/jobs")                                                                           \
    X(kRelation_Jobs_Delete, "/jobs#delete")                                                             \
    X(kRelation_Jobs_Transfer, "/jobs/transfer")                                                         \
    X(kRelation_Jobs_Ingest, "/jobs/ingest")                                                             \
    X(kRelation_Jobs_Export, "/jobs/export")                                                             \
    X(kRelation_Jobs_ProductionConversion, "/jobs/productionconversion")                                 \
    X(kRelation_Jobs_Transfer_Create, "/jobs/transfer#create")                                           \
    X(kRelation_Jobs_Ingest_Create, "/jobs/ingest#create")                                               \
    X(kRelation_Jobs_Export_Create, "/jobs/export#create")                                               \
    X(kRelation_Jobs_ProductionConversion_Create, "/jobs/productionconversion#create")                   \
    X(kRelation_Assets, "/assets")                                                                       \
    X(kRelation_Assets_Full, "/assets#full")                                                             \
    X(kRelation_Assets_Restore, "/assets#restore")                                                       \
    X(kRelation_Assets_Asset_ById, "/assets/asset#byId")                                                 \
    X(kRelation_Assets_Asset_Create, "/assets/asset#create")                                             \
    X(kRelation_Enclosures_Enclosure, "/enclosures/enclosure")                                           \
    X(kRelation_Enclosures_Enclosure_ByContentId, "/enclosures/enclosure#byContentId")                   \
    X(kRelation_Enclosures_Enclosure_Create, "/enclosures/enclosure#create")                             \
    X(kRelation_Renditions, "/renditions")                                                               \
    X(kRelation_Renditions_Rendition, "/renditions/rendition")                                           \
    X(kRelation_Renditions_Rendition_Create, "/renditions/rendition#create")                             \
    X(kRelation_Sessions, "/sessions")                                                                   \
    X(kRelation_Sessions_Session_Push, "/sessions/session#push")                                         \
    X(kRelation_Sessions_Session_Pull, "/sessions/session#pull")                                         \
    X(kRelation_Sessions_Session_OutgoingChanges, "/sessions/session#outgoingChanges")                   \
    X(kRelation_Sessions_Session_IncomingChanges, "/sessions/session#incomingChanges")                   \
    X(kRelation_Sessions_Session_Copy, "/sessions/session#copy")                                         \
    X(kRelation_Transactions, "/transactions")                                                           \
    X(kRelation_Transactions_Transaction_Commit, "/transactions/transaction#commit")                     \
    X(kRelation_Transactions_Transaction_Rollback, "/transactions/transaction#rollback")                 \
    X(kRelation_Productions_Production_Access, "/productions/production#access")                         \
    X(kRelation_Productions_Production_RemoveAccess, "/productions/production#removeAccess")             \
    X(kRelation_Productions_Production_History, "/productions/production#history")                       \
    X(kRelation_Productions_Production_Copy, "/productions/production#copy")                             \
    X(kRelation_Productions_Production_Create_Production, "/productions/production#create-production")   \
    X(kRelation_Users_User_Enclosures_User, "/users/user/enclosures/user")                               \
    X(kRelation_Users_User_Enclosures_Admin, "/users/user/enclosures/admin")                             \
    X(kRelation_Bulk_Create, "/bulk#create")                                                             \
    X(kRelation_Bulk_Delete, "/bulk#delete")                                                             \
    X(kRelation_Bulk_Edit, "/bulk#edit")

// X(constant, plain word)
#define ZOCL_PLAIN_RELATION_TABLE(X)             \
    X(kRelation_Self, "self")                    \
    X(kRelation_Edit, "edit")                    \
    X(kRelation_LatestVersion, "latest-version") \
    X(kRelation_Delete, "delete")                \
    X(kRelation_Up, "up")                        \
    X(kRelation_EditMedia, "edit-media")         \
    X(kRelation_Create, "create")                \
    X(kRelation_Locator, "locator")              \
    X(kRelation_Related, "related")              \
    X(kRelation_Next, "next")                    \
    X(kRelation_AcceptTheirs, "accept-theirs")   \
    X(kRelation_AcceptYours, "accept-yours")

namespace ZOCL {

/// What the relations with a path begin with.
extern const ImmutableString kRelationBase;

#define ZOCL_RELATION_CONSTANT(constant, text) extern const ImmutableString constant;
ZOCL_RELATION_TABLE(ZOCL_RELATION_CONSTANT)
ZOCL_PLAIN_RELATION_TABLE(ZOCL_RELATION_CONSTANT)
#undef ZOCL_RELATION_CONSTANT

}  // namespace ZOCL
