// What the client does when memory runs out, and what it leaves in memory that it gives back.

#include "hints/hints_client.h"
#include "hints/hints_connection.h"
#include "hints_test.h"
#include "watched_memory.h"

namespace vlm::hints {
namespace {

using test::kAnySize;
using test::largestPiece;
using test::piecesWithSecret;
using test::secret;

// Memory runs out when the bindings are about to be collected.
class LogOfAMachineOutOfMemory final : public platform::SystemLog {
public:
    bool collects(LogLevel) const override { return true; }
    void write(const platform::LogRecord& record) override {
        if (record.text.starts_with("transforming")) largestPiece = 4096;
    }
};

// How many bindings a reply holds is the service's choice.
TEST_F(HintsTest, AnswersNoBindingsWhenThereIsNoMemoryForThem) {
    PropertyList::Dictionary bindings;
    for (int i = 0; i < 1000; ++i) bindings.append(std::to_string(i), kHash);
    serve(replyWith(*platform::writeBinaryPropertyList(bindings)));
    LogOfAMachineOutOfMemory machine;
    fakePlatform().systemLog = &machine;

    const auto none = VLCopyLegacyBindings("alice", false);
    largestPiece = kAnySize;

    EXPECT_FALSE(none);
    EXPECT_EQ(ipc().openConnections, 0);
}

struct SecretRow {
    const char* why;
    String text;
    bool sendable;
};

TEST(SecretText, IsNotLeftBehindInMemory) {
    constexpr std::string_view kPin = "the PIN is 271828";
    const SecretRow rows[] = {
        {"stored as UTF-8", String(kPin), true},
        {"converted", String::fromUtf16(u"the PIN is 271828"), true},
        {"converted up to half a pair of units",
         String::fromUtf16(u"the PIN is 271828" + std::u16string{0xD83D}), false},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        piecesWithSecret = 0;
        secret = kPin;

        bool sendable = false;
        {
            Message message;
            sendable = setStringToMsgObject(&message, "str2", row.text);
        }
        secret = {};

        EXPECT_EQ(sendable, row.sendable);
        EXPECT_EQ(piecesWithSecret, 0);
    }
}

TEST(SecretText, IsFoundWhereItIsLeftBehind) {
    constexpr std::string_view kPin = "the PIN is 271828";
    piecesWithSecret = 0;
    secret = kPin;

    // Called by name: a compiler may leave out what "new" and "delete" would do here.
    void* piece = ::operator new(kPin.size());
    kPin.copy(static_cast<char*>(piece), kPin.size());
    ::operator delete(piece);
    secret = {};

    EXPECT_EQ(piecesWithSecret, 1);
}

}  // namespace
}  // namespace vlm::hints
