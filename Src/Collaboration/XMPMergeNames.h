// The names of XMP that the rules of the automatic merge speak of.
#pragma once

#include "OrvaneXMP/Namespaces.h"

// X(function, namespace, local name)
#define ZOCL_XMP_MERGE_NAME_TABLE(X)                                 \
    X(MetadataDate, OrvaneXMP::kNamespace_XMP, "MetadataDate")       \
    X(ModifyDate, OrvaneXMP::kNamespace_XMP, "ModifyDate")           \
    X(InstanceID, OrvaneXMP::kNamespace_XMPMM, "InstanceID")         \
    X(History, OrvaneXMP::kNamespace_XMPMM, "History")               \
    X(EventTime, OrvaneXMP::kNamespace_ResourceEvent, "when")        \
    X(Tracks, OrvaneXMP::kNamespace_XMPDM, "Tracks")                 \
    X(TrackName, OrvaneXMP::kNamespace_XMPDM, "trackName")           \
    X(TrackType, OrvaneXMP::kNamespace_XMPDM, "trackType")           \
    X(FrameRate, OrvaneXMP::kNamespace_XMPDM, "frameRate")           \
    X(Markers, OrvaneXMP::kNamespace_XMPDM, "markers")               \
    X(MarkerGuid, OrvaneXMP::kNamespace_XMPDM, "marker_guid")        \
    X(CuePointParams, OrvaneXMP::kNamespace_XMPDM, "cuePointParams") \
    X(CuePointKey, OrvaneXMP::kNamespace_XMPDM, "key")               \
    X(CuePointValue, OrvaneXMP::kNamespace_XMPDM, "value")

namespace ZOCL {
namespace XMPNames {

#define ZOCL_XMP_MERGE_NAME(function, uri, local)      \
    inline const OrvaneXMP::Name& function() {         \
        static const OrvaneXMP::Name name(uri, local); \
        return name;                                   \
    }
ZOCL_XMP_MERGE_NAME_TABLE(ZOCL_XMP_MERGE_NAME)
#undef ZOCL_XMP_MERGE_NAME

}  // namespace XMPNames
}  // namespace ZOCL
