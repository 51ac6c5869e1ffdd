#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <string>
#include <thread>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/urlclient.h"
#include "tests/io/driverfixture.h"

namespace zm {
namespace {

/// Answers one request on a port of this machine and ends.
class TOneShotServer {
public:
    TOneShotServer(std::string status, const std::vector<std::uint8_t>& body) {
        listener_ = ::socket(AF_INET, SOCK_STREAM, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof(address);
        EXPECT_EQ(0, ::bind(listener_, reinterpret_cast<sockaddr*>(&address), size));
        EXPECT_EQ(0, ::listen(listener_, 1));
        EXPECT_EQ(0, ::getsockname(listener_, reinterpret_cast<sockaddr*>(&address), &size));
        port_ = ntohs(address.sin_port);
        answer_ = "HTTP/1.1 " + std::move(status) +
                  "\r\nContent-Length: " + std::to_string(body.size()) +
                  "\r\nConnection: close\r\n\r\n" + std::string(body.begin(), body.end());
        thread_ = std::thread([this] { Serve(); });
    }
    ~TOneShotServer() {
        ::shutdown(listener_, SHUT_RDWR);  // ends a wait for a request that never came
        thread_.join();
        ::close(listener_);
    }
    std::u16string Url(const std::string& path) const { return Utf16FromUtf8(Host() + path); }
    std::string Host() const { return "http://127.0.0.1:" + std::to_string(port_); }
    /// Valid after the fetch.
    const std::string& Request() {
        thread_.join();
        thread_ = std::thread([] {});
        return request_;
    }

private:
    void Serve() {
        const int connection = ::accept(listener_, nullptr, nullptr);
        if (connection < 0) {
            return;
        }
        char buffer[4096];
        while (request_.find("\r\n\r\n") == std::string::npos) {
            const ssize_t got = ::recv(connection, buffer, sizeof(buffer), 0);
            if (got <= 0) {
                break;
            }
            request_.append(buffer, static_cast<std::size_t>(got));
        }
        for (std::size_t sent = 0; sent < answer_.size();) {
            const ssize_t now =
                ::send(connection, answer_.data() + sent, answer_.size() - sent, MSG_NOSIGNAL);
            if (now <= 0) {
                break;
            }
            sent += static_cast<std::size_t>(now);
        }
        ::close(connection);
    }

    int listener_ = -1;
    int port_ = 0;
    std::string answer_;
    std::string request_;
    std::thread thread_;
};

class Url : public test::DriverFixture {
protected:
    void SetUp() override {
        if (!platform::UrlClientIsAvailable()) {
            GTEST_SKIP() << "no transfer library is installed";
        }
        test::DriverFixture::SetUp();
    }
    TZalmoIO reader_;
};

TEST_F(Url, TypeByContentElseByTheNameInTheUrl) {
    TOneShotServer png("200 OK", SavedAs(ioPNG));
    EXPECT_TRUE(reader_.LoadFromFile(png.Url("/a%20b/photo?size=1"), /*check_unknown=*/false));
    test::ExpectSamePixels(*image_, *reader_.GetZmBitmap());
    EXPECT_TRUE(png.Request().starts_with("GET /a%20b/photo?size=1 HTTP/1.1\r\n"));
    TOneShotServer wbmp("200 OK", SavedAs(ioWBMP));
    EXPECT_TRUE(reader_.LoadFromURL(wbmp.Url("/photo.WBMP?x=a.png#top")));
    EXPECT_EQ(ioWBMP, reader_.GetParams()->fFileType);
    TOneShotServer text("200 OK", {'t', 'e', 'x', 't'});
    EXPECT_FALSE(reader_.LoadFromURL(text.Url("/page")));
}

TEST_F(Url, FailuresRunTheFinishNotice) {
    int finished = 0;
    reader_.SetOnFinishWork([&](void*) { ++finished; });
    TOneShotServer missing("404 Not Found", SavedAs(ioPNG));
    EXPECT_FALSE(reader_.LoadFromURL(missing.Url("/a.png")));
    EXPECT_EQ(1, finished);
    EXPECT_TRUE(reader_.GetAborting());
    EXPECT_FALSE(reader_.LoadFromURL(u"http://127.0.0.1:1/a.png"));  // nobody listens there
    EXPECT_EQ(2, finished);
}

TEST_F(Url, TheProxyOfTheSettingsIsAsked) {
    TOneShotServer proxy("200 OK", SavedAs(ioPNG));
    ZmGlobalSettings().fProxyAddress = Utf16FromUtf8(proxy.Host());
    ZmGlobalSettings().fProxyUser = u"me";
    ZmGlobalSettings().fProxyPassword = u"secret";
    EXPECT_TRUE(reader_.LoadFromURL(u"http://photos.invalid/a.png"));
    const std::string request = proxy.Request();
    EXPECT_TRUE(request.starts_with("GET http://photos.invalid/a.png HTTP/1.1\r\n")) << request;
    EXPECT_NE(std::string::npos, request.find("Proxy-Authorization: Basic bWU6c2VjcmV0"));
}

TEST_F(Url, OnlyNetworkProtocolsAndLimitedAnswers) {
    platform::TUrlRequest request;
    std::string error_text;
    request.url = u"file:///etc/hostname";
    EXPECT_FALSE(platform::FetchUrl(request, error_text).has_value());
    EXPECT_FALSE(error_text.empty());
    const std::vector<std::uint8_t> body(1000, 7);
    TOneShotServer server("200 OK", body);
    request.url = server.Url("/");
    request.max_bytes = 999;
    EXPECT_FALSE(platform::FetchUrl(request, error_text).has_value());
    EXPECT_EQ("the answer is too long", error_text);
    TOneShotServer again("200 OK", body);
    request.url = again.Url("/");
    request.max_bytes = 1000;
    EXPECT_EQ(body, platform::FetchUrl(request, error_text));
    TOneShotServer stopped("200 OK", body);
    request.url = stopped.Url("/");
    request.should_stop = [] { return true; };
    EXPECT_FALSE(platform::FetchUrl(request, error_text).has_value());
    EXPECT_EQ("stopped", error_text);
}

}  // namespace
}  // namespace zm
