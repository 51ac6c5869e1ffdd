#include <gtest/gtest.h>

#include "engine/io/zalmoio.h"
#include "engine/platform/urlclient.h"

namespace zm {
namespace {

TEST(Url, AFetchFromNobodyFails) {
    if (!platform::UrlClientIsAvailable()) {
        GTEST_SKIP() << "the system's client is missing";
    }
    platform::TUrlRequest request;
    request.url = u"http://127.0.0.1:1/a.png";
    std::string error_text;
    EXPECT_FALSE(platform::FetchUrl(request, error_text).has_value());
    EXPECT_FALSE(error_text.empty());
    int finished = 0;
    TZalmoIO io;
    io.SetOnFinishWork([&](void*) { ++finished; });
    EXPECT_FALSE(io.LoadFromURL(request.url));
    EXPECT_EQ(1, finished);
    EXPECT_TRUE(io.GetAborting());
}

}  // namespace
}  // namespace zm
