// TLS against real certificates, good and bad, and the choice of proxy and authorities.
#include <curl/curl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>

#include "net/Certificates.h"
#include "ostnet/NetworkSettings.h"
#include "Requester.h"

namespace ostnet_test {
namespace {

using testing::ElementsAre;
using testing::StartsWith;
using zotest::net::CertificateAuthority;

std::string Hello(const ReceivedRequest& inRequest) {
    return RawServer::Answer(200, "hello " + inRequest.target);
}

/// Sets a variable of the environment for a scope.
class ScopedEnvironment {
public:
    ScopedEnvironment(const char* inName, const std::string& inValue) : mName(inName) {
        if (const char* former = std::getenv(inName)) {
            mFormer = former;
        }
        setenv(inName, inValue.c_str(), 1);
    }
    ~ScopedEnvironment() {
        if (mFormer) {
            setenv(mName, mFormer->c_str(), 1);
        } else {
            unsetenv(mName);
        }
    }
    ScopedEnvironment(const ScopedEnvironment&) = delete;
    ScopedEnvironment& operator=(const ScopedEnvironment&) = delete;

private:
    const char* const mName;
    std::optional<std::string> mFormer;
};

class Trust : public testing::Test {
protected:
    static NetworkSettings Trusting(const std::string& inFile) {
        NetworkSettings settings = Requester::DefaultSettings();
        settings.certificateAuthorityFile = inFile;
        return settings;
    }
    void ExpectUntrusted(RawServer& ioServer, const std::string& inFile) {
        Requester requester(Trusting(inFile));
        const auto response = requester.Get(ioServer.URL("/secret"));
        EXPECT_EQ(response->status, 0);
        EXPECT_TRUE(Response::IsBadSSLCACert(response)) << response->curlError;
        EXPECT_FALSE(Response::IsNetworkConnectivityError(response));
        EXPECT_TRUE(ioServer.Requests().empty()) << "nothing may be sent to a peer that is not trusted";
    }
    CertificateAuthority mAuthority;
};

TEST_F(Trust, KnownAuthorityIsAcceptedAndConnectionKept) {
    RawServer server(RawServer::Answering(Hello), mAuthority.Issue("127.0.0.1"));
    Requester requester(Trusting(mAuthority.File()));
    EXPECT_EQ(Body(requester.Get(server.URL("/a"))), "hello /a");
    EXPECT_EQ(Body(requester.Get(server.URL("/b"))), "hello /b");
    EXPECT_EQ(server.ConnectionCount(), 1u);
    EXPECT_THAT(server.OfferedProtocols(), ElementsAre("h2", "http/1.1"));
}

TEST_F(Trust, UnknownAuthorityIsRefused) {
    const CertificateAuthority other;  // an impostor: its name is that of the trusted one
    RawServer server(RawServer::Answering(Hello), other.Issue("127.0.0.1"));
    ExpectUntrusted(server, mAuthority.File());
    ExpectUntrusted(server, "");
}

TEST_F(Trust, ExpiredCertificateIsRefused) {
    RawServer server(RawServer::Answering(Hello), mAuthority.Issue("127.0.0.1", -60));
    ExpectUntrusted(server, mAuthority.File());
}

TEST_F(Trust, OtherHostsCertificateIsRefused) {
    RawServer server(RawServer::Answering(Hello), mAuthority.Issue("hub.example"));
    ExpectUntrusted(server, mAuthority.File());
}

TEST_F(Trust, MissingAuthorityFileFailsClosed) {
    RawServer server(RawServer::Answering(Hello), mAuthority.Issue("127.0.0.1"));
    ExpectUntrusted(server, "/nowhere/authority.pem");
}

TEST_F(Trust, ResetInTheHandshakeIsAConnectivityError) {
    RawServer server([](Connection& ioConnection) { ioConnection.Reset(); });
    Requester requester(Trusting(mAuthority.File()));
    const auto response = requester.Get("https://127.0.0.1:" + std::to_string(server.Port()) + "/");
    EXPECT_EQ(response->status, 0);
    EXPECT_TRUE(Response::IsNetworkConnectivityError(response)) << response->curlError;
    EXPECT_FALSE(Response::IsBadSSLCACert(response));
}

TEST_F(Trust, CutWithoutCloseNotifyIsNoSuccess) {
    RawServer server(
        [](Connection& ioConnection) {
            ioConnection.ReadRequest();
            ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 100\r\n\r\nhalf");
            ioConnection.Reset();
        },
        mAuthority.Issue("127.0.0.1"));
    Requester requester(Trusting(mAuthority.File()));
    const auto response = requester.Get(server.URL("/"));
    EXPECT_EQ(response->status, 0);
    EXPECT_FALSE(response->payload);
    EXPECT_TRUE(Response::IsNetworkConnectivityError(response)) << response->curlError;
}

TEST_F(Trust, AChangeOfTheProcessSettingHoldsForTheNextRequest) {
    RawServer server(RawServer::Answering(Hello), mAuthority.Issue("127.0.0.1"));
    Completions done;
    NetworkProcessor processor{NetworkProcessor::SettingsSource(&ostnet::GetNetworkSettings)};
    const auto get = [&] {
        const Guid id = Guid::CreateUnique();
        processor.GET(id, done.Function(), ImmutableString(server.URL("/")), {}, {});
        return done.Wait(id);
    };
    EXPECT_TRUE(Response::IsBadSSLCACert(get()));
    ostnet::SetCertificateAuthorityFile(mAuthority.File());
    EXPECT_EQ(get()->status, 200);
    ostnet::SetCertificateAuthorityFile("");
    EXPECT_TRUE(Response::IsBadSSLCACert(get())) << "a kept connection must not outlive the trust in it";
}

TEST_F(Trust, EnvironmentNamesTheAuthorities) {
    const ScopedEnvironment file("SSL_CERT_FILE", "/a.pem"), directory("SSL_CERT_DIR", "/certs");
    const NetworkSettings usual = NetworkSettings::FromEnvironment();
    EXPECT_EQ(usual.certificateAuthorityFile, "/a.pem");
    EXPECT_EQ(usual.certificateAuthorityDirectory, "/certs");
    const ScopedEnvironment own("ZOCLIENT_CA_FILE", "/own.pem");
    const NetworkSettings chosen = NetworkSettings::FromEnvironment();
    EXPECT_EQ(chosen.certificateAuthorityFile, "/own.pem");
    EXPECT_EQ(chosen.certificateAuthorityDirectory, "");
}

class Proxy : public testing::Test {
protected:
    RawServer mTarget{RawServer::Answering(Hello)};
    RawServer mProxy{RawServer::Answering([](const ReceivedRequest& inRequest) {
        return RawServer::Answer(inRequest.method == "CONNECT" ? 403 : 200, "by proxy");
    })};
    const std::string mProxyURL = mProxy.URL("");
};

TEST_F(Proxy, OfTheSettingsIsUsedButForItsExceptions) {
    NetworkSettings settings = Requester::DefaultSettings();
    settings.proxy = mProxyURL;
    settings.noProxy = "localhost";
    Requester requester(settings);
    EXPECT_EQ(Body(requester.Get("http://hub.example/x")), "by proxy");
    EXPECT_EQ(mProxy.Requests().at(0).target, "http://hub.example/x");
    const std::string byName = "http://localhost:" + std::to_string(mTarget.Port()) + "/direct";
    EXPECT_EQ(Body(requester.Get(byName)), "hello /direct");
}

TEST_F(Proxy, OfTheEnvironmentIsUsedButForItsExceptions) {
    const ScopedEnvironment proxy("http_proxy", mProxyURL);
    {
        Requester requester;
        EXPECT_EQ(Body(requester.Get(mTarget.URL("/x"))), "by proxy");
    }
    for (const char* name : {"no_proxy", "NO_PROXY"}) {
        const ScopedEnvironment exception(name, "example.com,127.0.0.1");
        Requester requester;
        EXPECT_EQ(Body(requester.Get(mTarget.URL("/x"))), "hello /x") << name;
    }
    {
        NetworkSettings settings = Requester::DefaultSettings();
        settings.proxy = "http://127.0.0.1:1";
        settings.noProxy = "*";
        Requester requester(settings);
        EXPECT_EQ(Body(requester.Get(mTarget.URL("/x"))), "hello /x")
            << "the setting goes over the environment";
    }
    const ScopedEnvironment own("ZOCLIENT_PROXY", "http://own.example:3128"),
        none("ZOCLIENT_NO_PROXY", "a,b");
    EXPECT_EQ(NetworkSettings::FromEnvironment().proxy, "http://own.example:3128");
    EXPECT_EQ(NetworkSettings::FromEnvironment().noProxy, "a,b");
}

TEST_F(Proxy, SeesNoneOfOurHeadersWhenItTunnels) {
    NetworkSettings settings = Requester::DefaultSettings();
    settings.proxy = mProxyURL;
    Requester requester(settings);
    const auto response = requester.Get("https://hub.example/secret",
                                        {{ostnet::kHEADER_COOKIE, ImmutableString("login-token=canary;")}});
    EXPECT_EQ(response->status, 0) << "the refusal of a proxy is not the answer of the hub";
    const auto request = mProxy.Requests().at(0);
    EXPECT_EQ(request.target, "hub.example:443");
    EXPECT_EQ(request.Header("Cookie"), std::nullopt);
    EXPECT_EQ(request.Raw().find("canary"), std::string::npos);
    EXPECT_EQ(request.Raw().find("secret"), std::string::npos);
}

}  // namespace
}  // namespace ostnet_test
