// What the functions that answer by data or endpoints make of the service's reply.

#include <algorithm>
#include <memory>

#include "hints/hints_client.h"
#include "hints_test.h"

namespace vlm::hints {
namespace {

const std::string kDeserializing = "debug: deserializing result";

Message replyWithList(const PropertyList& list) {
    return replyWith(*platform::writeBinaryPropertyList(list));
}

const PropertyList kThreeBindings =
    PropertyList::Dictionary{{"zulu", Bytes{3}}, {"alpha", Bytes{1}}, {"mike", Bytes{2}}};

struct Row {
    const char* why;
    Message reply;
    std::string tokens;    // VLCopyAvailableTokensInfo()
    std::string bindings;  // VLCopyLegacyBindings()
    bool parsed;
};

std::vector<Row> rows() {
    const PropertyList::Dictionary empty;
    return {
        {"a dictionary", replyWithList(kThreeBindings),
         R"({"zulu": <03>, "alpha": <01>, "mike": <02>})", "[<03>, <01>, <02>]", true},
        {"an empty dictionary", replyWithList(empty), "{}", "[]", true},
        {"a list of another kind", replyWithList(PropertyList::Array{1, "two"}), R"([1, "two"])",
         "none", true},
        {"bytes that are no property list", replyWith(Bytes{1, 2, 3}), "none", "none", true},
        {"no bytes at all", replyWith(Bytes{}), "none", "none", true},
        {"a number is no data", replyWith(std::int64_t{0}), "none", "none", false},
        {"an error beside a list", failed(replyWithList(kThreeBindings)), "none", "none", false},
        {"an error alone", failed(), "none", "none", false},
        {"nothing", {}, "none", "none", false},
    };
}

class DataReplies : public HintsTest {
protected:
    bool lastCallSaidItParses(std::size_t linesBefore) {
        const auto lines = logged();
        return std::count(lines.begin() + static_cast<std::ptrdiff_t>(linesBefore), lines.end(),
                          kDeserializing) == 1;
    }
};

TEST_F(DataReplies, AreThePropertyListOfTheTokens) {
    for (const auto& row : rows()) {
        SCOPED_TRACE(row.why);
        serve(row.reply);
        const auto before = logged().size();

        EXPECT_EQ(shown(VLCopyAvailableTokensInfo(1000, std::nullopt)), row.tokens);
        EXPECT_EQ(lastCallSaidItParses(before), row.parsed);
    }
}

TEST_F(DataReplies, AreTheValuesOfTheBindings) {
    for (const auto& row : rows()) {
        SCOPED_TRACE(row.why);
        serve(row.reply);
        const auto before = logged().size();

        EXPECT_EQ(shown(VLCopyLegacyBindings("alice", false)), row.bindings);
        EXPECT_EQ(lastCallSaidItParses(before), row.parsed);
    }
}

TEST_F(DataReplies, OfThreeBindingsAreAnArrayOfTheirThreeValues) {
    serve(replyWithList(kThreeBindings));

    const auto bindings = VLCopyLegacyBindings("alice", true);

    ASSERT_TRUE(bindings);
    EXPECT_EQ(*bindings, (PropertyList::Array{Bytes{3}, Bytes{1}, Bytes{2}}));
    EXPECT_EQ(logged(), (std::vector<std::string>{"debug: VLCopyLegacyBindings",
                                                  "debug: setupConnection, forceDaemon 1",
                                                  kDeserializing, "debug: transforming 3 hashes",
                                                  "debug: result [<03>, <01>, <02>]"}));
}

TEST_F(DataReplies, AreNoneFromAServiceThatIsNotThere) {
    ipc().serve(nullptr);

    EXPECT_FALSE(VLCopyAvailableTokensInfo(0, std::nullopt));
    EXPECT_FALSE(VLCopyLegacyBindings("alice", false));
    EXPECT_EQ(ipc().openConnections, 0);
}

class TokenEndpoints : public HintsTest {
protected:
    static Message replyWithEndpoints(bool withSecond = true) {
        Message reply;
        reply.set("dat1", kFirst);
        if (withSecond) reply.set("dat2", kSecond);
        return reply;
    }

    static inline const Endpoint kFirst{std::make_shared<const int>(10)};
    static inline const Endpoint kSecond{std::make_shared<const int>(11)};

    std::optional<Endpoint> first;
    std::optional<Endpoint> second;
    std::optional<Error> error;
};

TEST_F(TokenEndpoints, GoToThePlacesForThem) {
    serve(replyWithEndpoints());

    EXPECT_TRUE(VLCopyTokenEndpoints(1000, &first, &second, &error));
    EXPECT_EQ(first, kFirst);
    EXPECT_EQ(second, kSecond);
    EXPECT_FALSE(error);
}

TEST_F(TokenEndpoints, GoToEitherPlaceAlone) {
    serve(replyWithEndpoints());

    EXPECT_TRUE(VLCopyTokenEndpoints(1000, &first, nullptr, nullptr));
    EXPECT_TRUE(VLCopyTokenEndpoints(1000, nullptr, &second, nullptr));
    EXPECT_EQ(first, kFirst);
    EXPECT_EQ(second, kSecond);
}

TEST_F(TokenEndpoints, AreAskedForAlsoWithoutPlacesAndTheAnswerIsWhetherAnErrorCame) {
    serve(replyWithEndpoints());
    EXPECT_TRUE(VLCopyTokenEndpoints(1000, nullptr, nullptr, nullptr));

    serve(failed());
    EXPECT_FALSE(VLCopyTokenEndpoints(1000, nullptr, nullptr, nullptr));

    EXPECT_EQ(ipc().exchanges.size(), 2u);
}

TEST_F(TokenEndpoints, AreNoneWhereTheReplyHasNone) {
    second = kSecond;
    serve(replyWithEndpoints(/*withSecond=*/false));

    EXPECT_TRUE(VLCopyTokenEndpoints(1000, &first, &second, &error));
    EXPECT_EQ(first, kFirst);
    EXPECT_FALSE(second);
}

TEST_F(TokenEndpoints, StayOutOfThePlacesWhenTheReplyCarriesAnError) {
    first = kSecond;
    serve(failed(replyWithEndpoints()));

    EXPECT_FALSE(VLCopyTokenEndpoints(1000, &first, &second, &error));
    EXPECT_EQ(first, kSecond);
    EXPECT_FALSE(second);
    EXPECT_EQ(error, refusal());
}

}  // namespace
}  // namespace vlm::hints
