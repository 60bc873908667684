#include "platform/linux/sd_bus_message.h"

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <functional>
#include <random>

#include "platform/linux/sd_bus_handles.h"

namespace vlm::test {

namespace {

using platform::Bytes;
using platform::Message;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

class SdBusMessageTest : public ::testing::Test {
protected:
    // Nobody is at the other end: messages are made and read, and never sent.
    void SetUp() override {
        std::array<int, 2> ends{};
        ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()), 0);
        _otherEnd = ends[1];
        sd_bus* bus = nullptr;
        ASSERT_GE(sd_bus_new(&bus), 0);
        _bus.reset(bus);
        ASSERT_GE(sd_bus_set_fd(bus, ends[0], ends[0]), 0);
        ASSERT_GE(sd_bus_start(bus), 0);
    }
    void TearDown() override { ::close(_otherEnd); }

    platform::SdBusMessage empty() {
        sd_bus_message* message = nullptr;
        EXPECT_GE(sd_bus_message_new_signal(_bus.get(), &message, "/o", "org.example", "S"), 0);
        return platform::SdBusMessage(message);
    }

    // What a reader gets to see of a message.
    static sd_bus_message* sealed(const platform::SdBusMessage& message) {
        EXPECT_GE(sd_bus_message_seal(message.get(), 1, 0), 0);
        EXPECT_GE(sd_bus_message_rewind(message.get(), 1), 0);
        return message.get();
    }

    std::optional<platform::ReadDictionary> written(
        const std::function<void(sd_bus_message*)>& write) {
        const auto message = empty();
        write(message.get());
        return platform::readDictionary(sealed(message), reason);
    }

    std::optional<platform::ReadDictionary> passedOn(const Message& dictionary) {
        const auto message = empty();
        if (!platform::appendDictionary(message.get(), dictionary, reason)) return std::nullopt;
        return platform::readDictionary(sealed(message), reason);
    }

    std::string reason;

private:
    platform::SdBus _bus;
    int _otherEnd = -1;
};

TEST_F(SdBusMessageTest, KeepsEveryDictionaryAsItIs) {
    std::mt19937_64 random(20);  // NOLINT: the same dictionaries in every run
    const auto value = [&]() -> Message::Value {
        const auto size = static_cast<std::size_t>(random() % 40);
        switch (random() % 4) {
            case 0:
                return static_cast<std::uint64_t>(random());
            case 1:
                return static_cast<std::int64_t>(random());
            case 2:
                return std::string(size, static_cast<char>('a' + random() % 26));
            default:
                return Bytes(size, static_cast<std::uint8_t>(random()));
        }
    };
    for (int round = 0; round < 1000; ++round) {
        Message dictionary;
        for (auto count = random() % 12; count > 0; --count)
            dictionary.set("k" + std::to_string(random() % 100), value());

        const auto read = passedOn(dictionary);

        ASSERT_TRUE(read) << reason;
        ASSERT_EQ(read->message, dictionary) << round;
        ASSERT_THAT(read->foreignKeys, IsEmpty());
        ASSERT_THAT(read->repeatedKeys, IsEmpty());
    }
}

TEST_F(SdBusMessageTest, ReportsForeignTypesAndReadsTheRest) {
    const auto read = written([](sd_bus_message* to) {
        sd_bus_message_append(to, "a{sv}", 9, "boolean", "b", 1, "small", "i", 1, "real", "d", 1.0,
                              "texts", "as", 2, "a", "b", "path", "o", "/a", "variant", "v", "s",
                              "a", "dictionary", "a{sv}", 1, "op", "t", std::uint64_t{9}, "pair",
                              "(tt)", std::uint64_t{1}, std::uint64_t{2}, "op", "t",
                              std::uint64_t{5});
    });

    ASSERT_TRUE(read) << reason;
    EXPECT_EQ(read->message.entries().size(), 1U);
    EXPECT_EQ(read->message.unsignedInteger("op"), 5U);
    EXPECT_THAT(read->foreignKeys, ElementsAre("boolean", "small", "real", "texts", "path",
                                               "variant", "dictionary", "pair"));
}

TEST_F(SdBusMessageTest, LetsTheLastOfSeveralEntriesCountAndReportsThem) {
    const auto read = written([](sd_bus_message* to) {
        sd_bus_message_append(to, "a{sv}", 3, "op", "t", std::uint64_t{1}, "uid", "x",
                              std::int64_t{2}, "op", "t", std::uint64_t{3});
    });

    ASSERT_TRUE(read) << reason;
    EXPECT_EQ(read->message.unsignedInteger("op"), 3U);
    EXPECT_EQ(read->message.entries().size(), 2U);
    EXPECT_THAT(read->repeatedKeys, ElementsAre("op"));
}

TEST_F(SdBusMessageTest, RefusesWhatIsNoDictionaryOfOurs) {
    struct Row {
        const char* why;
        const char* reason;
        std::function<void(sd_bus_message*)> write;
    };
    const auto entries = [](std::size_t count, const std::string& key) {
        return [count, key](sd_bus_message* to) {
            sd_bus_message_open_container(to, 'a', "{sv}");
            for (std::size_t number = 0; number < count; ++number)
                sd_bus_message_append(to, "{sv}", (key + std::to_string(number)).c_str(), "t",
                                      std::uint64_t{1});
            sd_bus_message_close_container(to);
        };
    };
    const Row rows[] = {
        {"no content", "of type \"\" instead of \"a{sv}\"", [](sd_bus_message*) {}},
        {"text", "of type \"s\"", [](sd_bus_message* to) { sd_bus_message_append(to, "s", "a"); }},
        {"texts", "of type \"a{ss}\"",
         [](sd_bus_message* to) { sd_bus_message_append(to, "a{ss}", 1, "a", "b"); }},
        {"two dictionaries", "of type \"a{sv}a{sv}\"",
         [](sd_bus_message* to) { sd_bus_message_append(to, "a{sv}a{sv}", 0, 0); }},
        {"too many entries", "more than 64 entries", entries(65, "k")},
        {"the same entry too often", "more than 64 entries",
         [](sd_bus_message* to) {
             sd_bus_message_open_container(to, 'a', "{sv}");
             for (int count = 0; count < 65; ++count)
                 sd_bus_message_append(to, "{sv}", "op", "b", 1);
             sd_bus_message_close_container(to);
         }},
        {"a long key", "longer than 64 bytes", entries(1, std::string(64, 'k'))},
        {"too large a text", "larger than 16777216 bytes",
         [](sd_bus_message* to) {
             const std::string text((std::size_t{16} << 20U) + 1, 'x');
             sd_bus_message_append(to, "a{sv}", 1, "a", "s", text.c_str());
         }},
        {"too large together", "larger than 16777216 bytes",
         [](sd_bus_message* to) {
             const std::string text(std::size_t{9} << 20U, 'x');
             sd_bus_message_append(to, "a{sv}", 2, "a", "s", text.c_str(), "b", "s", text.c_str());
         }},
    };
    for (const auto& row : rows) {
        reason.clear();
        EXPECT_FALSE(written(row.write)) << row.why;
        EXPECT_THAT(reason, HasSubstr(row.reason)) << row.why;
    }
}

TEST_F(SdBusMessageTest, ReadsAsMuchAsIsAllowed) {
    EXPECT_TRUE(written([](sd_bus_message* to) {
        sd_bus_message_open_container(to, 'a', "{sv}");
        for (int number = 0; number < 64; ++number)
            sd_bus_message_append(to, "{sv}",
                                  (std::string(62, 'k') + std::to_string(10 + number)).c_str(), "t",
                                  std::uint64_t{1});
        sd_bus_message_close_container(to);
    })) << reason;
}

TEST_F(SdBusMessageTest, RefusesToWriteWhatTheBusOrTheReaderDoesNotTake) {
    struct Row {
        const char* why;
        const char* reason;
        std::string key;
        Message::Value value;
    };
    const Row rows[] = {
        {"broken UTF-8", "\"str1\" is not UTF-8", "str1", std::string("a\xC3")},
        {"a zero within", "\"str1\" is not UTF-8", "str1", std::string("a\0b", 3)},
        {"a surrogate", "\"str1\" is not UTF-8", "str1", std::string("\xED\xA0\x80")},
        {"a broken key", "a key is not UTF-8", "\xFF", std::uint64_t{1}},
        {"no endpoint at all", "\"dat1\" is an endpoint without", "dat1", platform::Endpoint{}},
        {"an endpoint that is closed", "\"dat1\" cannot be sent", "dat1",
         platform::Endpoint{std::make_shared<const int>(-7)}},
        {"a long key", "longer than 64 bytes", std::string(65, 'k'), std::uint64_t{1}},
        {"too much", "larger than 16777216 bytes", "dat1", Bytes(std::size_t{16} << 20U)},
    };
    for (const auto& row : rows) {
        Message dictionary;
        dictionary.set(row.key, row.value);
        reason.clear();

        EXPECT_FALSE(passedOn(dictionary)) << row.why;
        EXPECT_THAT(reason, HasSubstr(row.reason)) << row.why;
    }
}

TEST_F(SdBusMessageTest, RefusesToWriteTooManyEntries) {
    Message dictionary;
    for (int number = 0; number < 65; ++number)
        dictionary.set(std::to_string(number), std::uint64_t{});

    EXPECT_FALSE(passedOn(dictionary));
    EXPECT_THAT(reason, HasSubstr("more than 64 entries"));
}

TEST_F(SdBusMessageTest, HandsOutEndpointsOfTheReadersOwn) {
    std::array<int, 2> ends{};
    ASSERT_EQ(::pipe(ends.data()), 0);
    Message dictionary;
    dictionary.set("dat1", platform::Endpoint{std::make_shared<const int>(ends[1])});

    auto read = passedOn(dictionary);

    ASSERT_TRUE(read) << reason;
    const auto endpoint = read->message.endpoint("dat1");
    ASSERT_TRUE(endpoint && endpoint->descriptor);
    EXPECT_NE(*endpoint->descriptor, ends[1]);
    ::close(ends[1]);
    EXPECT_EQ(::write(*endpoint->descriptor, "x", 1), 1);
    ::close(ends[0]);
}

}  // namespace

}  // namespace vlm::test
