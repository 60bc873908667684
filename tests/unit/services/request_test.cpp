#include "services/hints/request.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "cards.h"
#include "platform/property_list.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

using platform::PropertyList;
using testing::HasSubstr;

Bytes query(const PropertyList& value) { return *platform::writeBinaryPropertyList(value); }

TEST(RequestTest, ReadsALogin) {
    const auto request = readRequest(requestOf(0, {{"dat1", hashOf(1)},
                                                   {"str1", text("pkcs11:token=a")},
                                                   {"str2", text("123456")},
                                                   {"uid", signedNumber(1000)}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->operation, Operation::Login);
    EXPECT_EQ(request->hash, hashOf(1));
    EXPECT_EQ(request->tokenIdentifier, "pkcs11:token=a");
    EXPECT_EQ(request->pin->text(), "123456");
    EXPECT_EQ(request->user, 1000u);
}

TEST(RequestTest, ReadsALoginWithoutAPin) {
    const auto request = readRequest(requestOf(
        0, {{"dat1", hashOf(1)}, {"str1", text("pkcs11:token=a")}, {"uid", signedNumber(-1)}}));

    ASSERT_TRUE(request);
    EXPECT_FALSE(request->pin);
    EXPECT_EQ(request->user, platform::kNobody);
}

TEST(RequestTest, ReadsAnAllOnesUserAsNobody) {
    const auto request = readRequest(requestOf(1, {{"uid", signedNumber(4294967295)}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->user, platform::kNobody);
}

TEST(RequestTest, ReadsTheTokenOfAQuery) {
    const PropertyList onlyOne = PropertyList::Dictionary{{"tokid", "pkcs11:token=a"}};

    const auto request =
        readRequest(requestOf(1, {{"dat1", query(onlyOne)}, {"uid", signedNumber(-1)}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->tokenIdentifier, "pkcs11:token=a");
}

TEST(RequestTest, TakesAQueryWithoutATokenForAllTokens) {
    const auto request = readRequest(
        requestOf(1, {{"dat1", query(PropertyList::Dictionary{})}, {"uid", signedNumber(-1)}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->tokenIdentifier, "");
}

TEST(RequestTest, ReadsThePairingsOfAnAccountOnInsertedTokens) {
    const auto request =
        readRequest(requestOf(4, {{"num1", signedNumber(1)}, {"str1", text("alice")}}));

    ASSERT_TRUE(request);
    EXPECT_TRUE(request->insertedOnly);
    EXPECT_EQ(request->account, "alice");
}

TEST(RequestTest, PassesOverKeysThatItDoesNotKnow) {
    auto incoming = requestOf(6, {{"str1", text("alice")}, {"colour", text("blue")}});
    incoming.unreadableKeys = {"shape"};

    EXPECT_TRUE(readRequest(incoming));
}

IncomingRequest storing(const platform::Message::Entry& changed = {"str3", text("")}) {
    auto request = requestOf(9, {{"uid", signedNumber(1000)},
                                 {"dat1", hashOf(1)},
                                 {"dat2", hashOf(2)},
                                 {"str1", text("pkcs11:token=a")},
                                 {"str2", text("/keyring")}});
    request.message.set(changed.first, changed.second);
    return request;
}

TEST(RequestTest, ReadsTheStoringOfAnUnlockKey) {
    const auto request = readRequest(storing());

    ASSERT_TRUE(request);
    EXPECT_EQ(request->operation, Operation::StoreUnlockKey);
    EXPECT_EQ(request->user, 1000u);
    EXPECT_EQ(request->hash, hashOf(1));
    EXPECT_EQ(request->wrapKeyHash, hashOf(2));
    EXPECT_EQ(request->tokenIdentifier, "pkcs11:token=a");
    EXPECT_EQ(request->keyring, "/keyring");
}

TEST(RequestTest, ReadsANewPasswordFromItsPipe) {
    const auto request = readRequest(
        requestOf(13, {{"str1", text("alice")}, {"dat1", *pipeHolding(Secret("sesame"))}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(request->account, "alice");
    EXPECT_EQ(request->password->text(), "sesame");
}

TEST(RequestTest, SaysWhatItAsksForWithoutItsSecrets) {
    for (const auto& incoming :
         {requestOf(13, {{"str1", text("alice")}, {"dat1", *pipeHolding(Secret("sesame"))}}),
          requestOf(5, {{"uid", signedNumber(1000)}, {"str1", text("sesame")}})}) {
        const auto request = readRequest(incoming);
        ASSERT_TRUE(request);
        EXPECT_FALSE(describe(*request).empty());
        EXPECT_THAT(describe(*request), testing::Not(HasSubstr("sesame")));
    }
}

struct Hostile {
    const char* why;
    IncomingRequest request;
    const char* named;
};

IncomingRequest withUnreadable(IncomingRequest request, const std::string& key) {
    request.unreadableKeys.push_back(key);
    return request;
}

std::vector<Hostile> hostileRequests() {
    const auto uid = signedNumber(-1);
    const std::string long257(257, 'x');
    const std::string long2049(2049, 'x');
    const PropertyList numberedToken = PropertyList::Dictionary{{"tokid", 7}};
    const PropertyList emptyToken = PropertyList::Dictionary{{"tokid", ""}};
    const PropertyList large =
        PropertyList::Dictionary{{"tokid", "t"}, {"more", Bytes(std::size_t{64} << 10U)}};
    PropertyList deep = 1;
    for (int level = 0; level < 20; ++level) deep = PropertyList::Array{deep};
    deep = PropertyList::Dictionary{{"tokid", "t"}, {"more", deep}};
    return {
        {"no operation", {}, "\"op\""},
        {"an operation that does not exist", requestOf(99), "\"op\""},
        {"a storing without a wrap key", storing({"dat2", text("x")}), "\"dat2\""},
        {"a short wrap key's hash", storing({"dat2", Bytes(31)}), "\"dat2\""},
        {"a storing without a token", storing({"str1", text("")}), "\"str1\""},
        {"a storing without a keyring", storing({"str2", text("")}), "\"str2\""},
        {"a storing with a text that is none", storing({"str3", Bytes(1)}), "\"str3\""},
        {"a storing with a long text", storing({"str3", text(std::string(4097, 'x'))}), "\"str3\""},
        {"an erasing without a hash", requestOf(10, {{"str1", text("alice")}}), "\"dat1\""},
        {"a new password as text",
         requestOf(13, {{"str1", text("alice")}, {"dat1", text("secret")}}), "\"dat1\""},
        {"a new password that is too long",
         requestOf(
             13, {{"str1", text("alice")}, {"dat1", *pipeHolding(Secret(std::string(1025, 'x')))}}),
         "\"dat1\""},
        {"no new password", requestOf(13, {{"str1", text("alice")}}), "\"dat1\""},
        {"a keyring's password that is too long",
         requestOf(5, {{"uid", uid}, {"str1", text(std::string(1025, 'x'))}}), "\"str1\""},
        {"an absurd operation", requestOf(UINT64_MAX), "\"op\""},
        {"a signed operation", requestOf(1, {{"op", signedNumber(1)}}), "\"op\""},
        {"an operation as text", requestOf(1, {{"op", text("1")}}), "\"op\""},
        {"an operation that is there twice", withUnreadable(requestOf(1, {{"uid", uid}}), "op"),
         "\"op\""},
        {"a user of a foreign type", withUnreadable(requestOf(1), "uid"), "\"uid\""},
        {"no user", requestOf(1), "\"uid\""},
        {"an unsigned user", requestOf(1, {{"uid", std::uint64_t{1}}}), "\"uid\""},
        {"a user below nobody", requestOf(1, {{"uid", signedNumber(-2)}}), "\"uid\""},
        {"a user beyond 32 bits", requestOf(1, {{"uid", signedNumber(4294967296)}}), "\"uid\""},
        {"the smallest number as a user", requestOf(1, {{"uid", signedNumber(INT64_MIN)}}),
         "\"uid\""},
        {"no hash", requestOf(2, {{"str1", text("alice")}}), "\"dat1\""},
        {"a hash as text", requestOf(2, {{"dat1", text("x")}, {"str1", text("alice")}}),
         "\"dat1\""},
        {"an empty hash", requestOf(2, {{"dat1", Bytes{}}, {"str1", text("alice")}}), "\"dat1\""},
        {"a short hash", requestOf(2, {{"dat1", Bytes(31)}, {"str1", text("alice")}}), "\"dat1\""},
        {"a long hash", requestOf(2, {{"dat1", Bytes(33)}, {"str1", text("alice")}}), "\"dat1\""},
        {"no account to pair", requestOf(2, {{"dat1", hashOf(1)}}), "\"str1\""},
        {"no account to unpair", requestOf(3, {{"dat1", hashOf(1)}}), "\"str1\""},
        {"an empty account", requestOf(6, {{"str1", text("")}}), "\"str1\""},
        {"a long account", requestOf(6, {{"str1", text(long257)}}), "\"str1\""},
        {"an account as bytes", requestOf(6, {{"str1", Bytes{'a'}}}), "\"str1\""},
        {"an endpoint for an account", requestOf(6, {{"str1", platform::Endpoint{}}}), "\"str1\""},
        {"no token", requestOf(0, {{"dat1", hashOf(1)}, {"uid", uid}}), "\"str1\""},
        {"a long token",
         requestOf(0, {{"dat1", hashOf(1)}, {"str1", text(long2049)}, {"uid", uid}}), "\"str1\""},
        {"an empty PIN",
         requestOf(0, {{"dat1", hashOf(1)}, {"str1", text("t")}, {"str2", text("")}, {"uid", uid}}),
         "\"str2\""},
        {"a long PIN",
         requestOf(
             0, {{"dat1", hashOf(1)}, {"str1", text("t")}, {"str2", text(long257)}, {"uid", uid}}),
         "\"str2\""},
        {"a PIN as bytes",
         requestOf(0,
                   {{"dat1", hashOf(1)}, {"str1", text("t")}, {"str2", Bytes{'1'}}, {"uid", uid}}),
         "\"str2\""},
        {"a third string of a wrong type",
         requestOf(0,
                   {{"dat1", hashOf(1)}, {"str1", text("t")}, {"str3", Bytes{'1'}}, {"uid", uid}}),
         "\"str3\""},
        {"no flag", requestOf(4, {{"str1", text("alice")}}), "\"num1\""},
        {"a flag that is neither", requestOf(4, {{"num1", signedNumber(2)}, {"str1", text("a")}}),
         "\"num1\""},
        {"a query that is no property list",
         requestOf(1, {{"dat1", Bytes{'b', 'p', 'l'}}, {"uid", uid}}), "\"dat1\""},
        {"a query as text", requestOf(1, {{"dat1", text("tokid")}, {"uid", uid}}), "\"dat1\""},
        {"a query that is no dictionary", requestOf(1, {{"dat1", query(1)}, {"uid", uid}}),
         "\"dat1\""},
        {"a query that is deep", requestOf(1, {{"dat1", query(deep)}, {"uid", uid}}), "\"dat1\""},
        {"a query that is large", requestOf(1, {{"dat1", query(large)}, {"uid", uid}}), "\"dat1\""},
        {"a query for a number", requestOf(1, {{"dat1", query(numberedToken)}, {"uid", uid}}),
         "\"tokid\""},
        {"a query for no token", requestOf(1, {{"dat1", query(emptyToken)}, {"uid", uid}}),
         "\"tokid\""},
    };
}

TEST(RequestTest, RefusesWhatIsNotLikeARequestAndNamesTheKey) {
    for (const auto& [why, incoming, named] : hostileRequests()) {
        SCOPED_TRACE(why);

        const auto request = readRequest(incoming);

        ASSERT_FALSE(request);
        EXPECT_EQ(request.refusal().status, status::kBadRequest);
        EXPECT_THAT(request.refusal().text, HasSubstr(named));
    }
}

TEST(RequestTest, NeverRepeatsAPinInARefusal) {
    const auto request = readRequest(requestOf(0, {{"dat1", hashOf(1)},
                                                   {"str1", text("t")},
                                                   {"str2", text(std::string(257, '7'))},
                                                   {"uid", signedNumber(-1)}}));

    ASSERT_FALSE(request);
    EXPECT_THAT(request.refusal().text, testing::Not(HasSubstr("777")));
}

TEST(RequestTest, DescribesARequestWithoutLettingItsTextActOnATerminal) {
    const auto request = readRequest(requestOf(6, {{"str1", text("al\x1b[2Jice\n")}}));

    ASSERT_TRUE(request);
    EXPECT_EQ(describe(*request), "Asking whether al\uFFFD[2Jice\uFFFD is paired");
}

}  // namespace
}  // namespace vlm::service
