// What requests of a login hold, as they are read.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "cards.h"
#include "services/hints/request.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

IncomingRequest login(platform::Message::Value pin) {
    return requestOf(12, {{"str1", text("alice")},
                          {"str2", text("pkcs11:token=a")},
                          {"dat1", hashOf(1)},
                          {"dat2", std::move(pin)}});
}

TEST(LoginRequestTest, TakesThePinOutOfItsPipe) {
    const auto pipe = *pipeHolding(Secret("123456"));

    const auto request = readRequest(login(pipe));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->account, "alice");
    EXPECT_EQ(request->tokenIdentifier, "pkcs11:token=a");
    EXPECT_EQ(request->hash, hashOf(1));
    EXPECT_EQ(request->pin->text(), "123456");
    EXPECT_FALSE(secretIn(pipe)) << "it is not in the pipe any more";
}

TEST(LoginRequestTest, DoesWithoutAPinWhereTheReaderAsks) {
    const auto request = readRequest(
        requestOf(12, {{"str1", text("alice")}, {"str2", text("t")}, {"dat1", hashOf(1)}}));

    ASSERT_TRUE(request);
    EXPECT_FALSE(request->pin);
}

TEST(LoginRequestTest, TakesNoPinFromAnythingElse) {
    const auto used = *pipeHolding(Secret("123456"));
    secretIn(used);
    const platform::Message::Value values[] = {
        text("123456"),       Bytes{1, 2}, signedNumber(3),
        platform::Endpoint(), used,        *pipeHolding(Secret(std::string(257, '1')))};
    for (const auto& value : values) {
        const auto request = readRequest(login(value));

        ASSERT_FALSE(request) << value.index();
        EXPECT_EQ(request.refusal().status, status::kBadRequest);
        EXPECT_THAT(request.refusal().text, HasSubstr("dat2"));
        EXPECT_THAT(request.refusal().text, testing::Not(HasSubstr("123456")));
    }
}

TEST(LoginRequestTest, LooksForAnybodysCardWithoutAName) {
    const auto request = readRequest(requestOf(11));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->account, "");
    EXPECT_FALSE(readRequest(requestOf(11, {{"str1", text("")}}))) << "an empty name is none";
}

TEST(LoginRequestTest, NamesTheKeyThatIsMissing) {
    struct {
        IncomingRequest request;
        const char* named;
    } const rows[] = {
        {requestOf(12, {{"str2", text("t")}, {"dat1", hashOf(1)}}), "str1"},
        {requestOf(12, {{"str1", text("alice")}, {"dat1", hashOf(1)}}), "str2"},
        {requestOf(12, {{"str1", text("alice")}, {"str2", text("t")}}), "dat1"},
        {requestOf(11, {{"str1", signedNumber(1)}}), "str1"},
        {requestOf(11, {{"str1", text(std::string(257, 'a'))}}), "str1"},
        {requestOf(14, {{"str2", text("alice")}, {"str3", text("t")}}), "str1"},
        {requestOf(14, {{"str1", text("c1")}, {"str3", text("t")}}), "str2"},
        {requestOf(14, {{"str1", text("c1")}, {"str2", text("alice")}}), "str3"},
        {requestOf(14, {{"str1", text(std::string(65, 'c'))}}), "str1"},
    };
    for (const auto& [request, named] : rows) {
        const auto read = readRequest(request);

        ASSERT_FALSE(read);
        EXPECT_THAT(read.refusal().text, HasSubstr(named));
    }
}

}  // namespace
}  // namespace vlm::service
