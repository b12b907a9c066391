// The first line is a Content-Type, the rest a body. Whatever they are, the reader of forms refuses them with
// a Failure or gives parts that lie inside the body; the readers of bulk forms refuse the form with a reason
// or give only what is complete.
#include <cstdint>
#include <cstdlib>
#include <set>
#include <string>

#include "Base/Error.h"
#include "Base/Text.h"
#include "Http/Multipart.h"
#include "Routes/BulkForm.h"
#include "Routes/BulkPartName.h"

using namespace zohub;

namespace {

using Kind = BulkPartName::Kind;

void Require(bool inHolds) {
    if (!inHolds)
        std::abort();
}

bool IsInside(std::string_view inInner, std::string_view inOuter) {
    return inInner.data() >= inOuter.data() &&
           inInner.data() + inInner.size() <= inOuter.data() + inOuter.size();
}

std::string Written(BulkPartName const& inName) {
    std::string const asset = "assets+" + std::string(inName.asset);
    if (inName.kind == Kind::Asset)
        return asset;
    if (inName.kind == Kind::AssetProperties)
        return asset + "+properties";
    std::string const field = inName.kind == Kind::EnclosureName ? "+name" : "+data";
    std::string const item = std::string(inName.item) + field;
    if (inName.asset.empty())
        return "enclosures+" + item;
    return asset + (inName.kind == Kind::RenditionData ? "+rendition+" : "+enclosure+") + item;
}

void CheckParts(Request const& inRequest) {
    try {
        Form const form(inRequest);
        bool const isMultipart = inRequest.headers[0].second.rfind("multipart/", 0) == 0;
        for (auto const& part : form.Parts()) {
            Require(!part.name.empty());
            Require(form.Find(part.name) != nullptr);
            Require(!isMultipart || IsInside(part.bytes, inRequest.body));
            if (auto const name = ReadBulkPartName(part.name))
                Require(Written(*name) == part.name);
        }
    } catch (Failure const& failure) {
        Require(failure.Status() >= 400 && failure.Status() < 500);
    }
}

void CheckItems(std::vector<BulkItem> const& inItems, BulkKind inKind) {
    std::size_t index = 0;
    for (auto const& item : inItems) {
        Require(item.part != nullptr && item.hash.size() == 64);
        Require(item.index == index++);
        Require(item.id.empty() == (inKind == BulkKind::Creation));
    }
}

void CheckBulk(Request const& inRequest, BulkKind inKind) {
    try {
        auto const form = ReadBulkForm(inKind, inRequest);
        Require(!form->form->Parts().empty());
        std::set<std::string_view> ids;
        for (auto const& asset : form->assets) {
            Require(asset.part != nullptr);
            Require(asset.id.empty() ? asset.properties.has_value() : ids.insert(asset.id).second);
            Require(inKind == BulkKind::Creation || !asset.id.empty());
            CheckItems(asset.enclosures, inKind);
            CheckItems(asset.renditions, inKind);
        }
        CheckItems(form->enclosures, inKind);
        Require(!form->assets.empty() || !form->enclosures.empty());
    } catch (Failure const& failure) {
        Require(failure.Status() >= 400 && failure.Status() < 500);
        Require(IsValidUtf8(failure.what()));
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* inBytes, std::size_t inSize) {
    std::string_view const input(reinterpret_cast<char const*>(inBytes), inSize);
    std::size_t const end = std::min(input.find('\n'), input.size());
    Request request;
    request.method = "POST";
    request.headers.emplace_back("Content-Type", input.substr(0, end));
    request.body = input.substr(std::min(end + 1, input.size()));
    CheckParts(request);
    for (BulkKind const kind : {BulkKind::Creation, BulkKind::Edit, BulkKind::Deletion})
        CheckBulk(request, kind);
    return 0;
}
