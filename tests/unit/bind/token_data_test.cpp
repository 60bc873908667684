#include "bind_operation_fixture.h"

namespace vlm {
namespace {

using platform::Message;
using platform::PropertyList;
using Dictionary = PropertyList::Dictionary;

class TokenData : public BindOperationTest {};

TEST_F(TokenData, IsTheRecordInTheAnswersContext) {
    const PropertyList record(Dictionary{{"tni", PropertyList::Array{"card"}}});
    service.tell(record);

    EXPECT_EQ(operation->tokenData(std::nullopt), record);
    EXPECT_TRUE(debugged("getting available token data for token: (null)"));
}

TEST_F(TokenData, IsHandedOnWhateverItsTypeIs) {
    service.tell("not a dictionary");

    EXPECT_EQ(operation->tokenData(std::nullopt), PropertyList("not a dictionary"));
}

TEST_F(TokenData, ForAllTokensIsAskedWithoutAFilterForTheConsoleUser) {
    sessions().login(1000, /*onConsole=*/true);
    insertBlue();

    operation->tokenData(std::nullopt);

    ASSERT_EQ(ipc().exchanges.size(), 1U);
    const Message& request = ipc().exchanges[0].request;
    EXPECT_EQ(request.unsignedInteger("op"), 1U);
    EXPECT_EQ(request.integer("uid"), 1000);
    EXPECT_FALSE(request.contains("dat1"));
}

TEST_F(TokenData, ForOneTokenIsAskedWithThatTokenAsTheOnlyFilter) {
    insertBlue();

    operation->tokenData(blue);

    ASSERT_EQ(ipc().exchanges.size(), 1U);
    const auto* filter = ipc().exchanges[0].request.bytes("dat1");
    ASSERT_NE(filter, nullptr);
    EXPECT_EQ(platform::readPropertyList(*filter), PropertyList(Dictionary{{"tokid", blue}}));
    EXPECT_TRUE(debugged("getting available token data for token: pkcs11:token=blue"));
}

struct NoData {
    const char* why;
    Message answer;
};

TEST_F(TokenData, IsNoneForAMissingOrEmptyAnswer) {
    Message failed = Service::propertyList(Dictionary{{"ctx", platform::Bytes{}}});
    platform::encodeReplyError({"VLErrorDomain", -2010, "the reader failed"}, &failed);
    Message noList;
    noList.set("res", platform::Bytes{'x'});
    const NoData rows[] = {
        {"no reply", Message()},
        {"a reply with an error", failed},
        {"a result that is no property list", noList},
        {"a status where a list belongs", Service::result(0)},
        {"an empty dictionary", Service::propertyList(Dictionary{})},
        {"a list that is no dictionary", Service::propertyList("ctx")},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        const auto before = log().texts(platform::LogLevel::Debug).size();
        service.script(Service::kCopyAvailableTokensInfo, row.answer);

        EXPECT_EQ(operation->tokenData(blue), std::nullopt);

        const auto lines = log().texts(platform::LogLevel::Debug);
        ASSERT_GT(lines.size(), before);
        EXPECT_EQ(lines.back(), "cannot get token data for token: pkcs11:token=blue");
        EXPECT_TRUE(log().texts(platform::LogLevel::Error).empty());
    }
}

TEST_F(TokenData, IsNoneWhenNoServiceCanBeReached) {
    ipc().serve(nullptr);

    EXPECT_EQ(operation->tokenData(std::nullopt), std::nullopt);
    EXPECT_TRUE(debugged("cannot get token data for token: (null)"));
}

TEST_F(TokenData, IsNoneAndAnErrorLineForAnAnswerWithoutAContext) {
    const PropertyList answers[] = {Dictionary{{"other", 1}}, Dictionary{{"ctx", "text"}}};
    for (const auto& answer : answers) {
        const auto before = log().texts(platform::LogLevel::Error).size();
        service.script(Service::kCopyAvailableTokensInfo, Service::propertyList(answer));

        EXPECT_EQ(operation->tokenData(blue), std::nullopt);

        const auto lines = log().texts(platform::LogLevel::Error);
        ASSERT_EQ(lines.size(), before + 1) << answer.describe();
        EXPECT_EQ(lines.back(), "no context data found for token: pkcs11:token=blue");
    }
}

TEST_F(TokenData, IsNoneAndAnErrorLineForAContextThatIsNoPropertyList) {
    service.script(Service::kCopyAvailableTokensInfo,
                   Service::propertyList(Dictionary{{"ctx", Bytes{'b', 'p', 'l'}}}));

    EXPECT_EQ(operation->tokenData(std::nullopt), std::nullopt);

    EXPECT_EQ(log().texts(platform::LogLevel::Error),
              std::vector<std::string>{"cannot deserialize context data for token: (null)"});
}

}  // namespace
}  // namespace vlm
