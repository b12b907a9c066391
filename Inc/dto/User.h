// A user as the server tells of one.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

class UserProperties : public TransferStructure<UserProperties> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::UserProperties";
    static const BindingTable& Table();

    std::string_view FirstName() const { return Text("firstname"); }
    std::string_view LastName() const { return Text("lastname"); }
    ImmutableString Email() const { return String("email"); }
};

class Login : public TransferStructure<Login> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Login";
    static const BindingTable& Table();

    ImmutableString IP() const { return String("ip"); }
    ImmutableString HostName() const { return String("hostname"); }
    ImmutableString UserAgent() const { return String("useragent"); }
};

class UserBlock : public TransferStructure<UserBlock> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::UserBlock";
    static const BindingTable& Table();

    ImmutableString Identifier() const { return String("zo:userId"); }
    UserProperties Properties() const { return Structure<UserProperties>("properties"); }
    BoundList<Login> Logins() const { return List<Login>("logins"); }
};

}  // namespace dto
}  // namespace ZOCL
