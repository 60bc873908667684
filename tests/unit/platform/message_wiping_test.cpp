// What a message leaves behind in the memory that it gives back. The whole test program's
// deallocation is replaced by one that looks for the secret before it frees.

#include <gtest/gtest.h>
#include <malloc.h>

#include <cstdlib>
#include <cstring>
#include <new>

#include "platform/message.h"

namespace {

// Short enough to lie inside a string object, as most PINs are. What is moved out of such an object
// leaves all but its first letter behind, so that much is looked for.
constexpr std::string_view kSecret = "S3cr3tPIN";
thread_local bool watching = false;
thread_local int secretsFreed = 0;

void freeWatched(void* memory) {
    if (watching && memory) {
        const std::string_view block(static_cast<const char*>(memory),
                                     ::malloc_usable_size(memory));
        if (block.find(kSecret.substr(1)) != std::string_view::npos) ++secretsFreed;
    }
    std::free(memory);
}

}  // namespace

void* operator new(std::size_t size) {
    if (void* memory = std::calloc(1, size)) return memory;
    throw std::bad_alloc();
}
void operator delete(void* memory) noexcept { freeWatched(memory); }
void operator delete(void* memory, std::size_t) noexcept { freeWatched(memory); }

namespace vlm::platform {
namespace {

class MessageWipingTest : public ::testing::Test {
protected:
    MessageWipingTest() {
        secretsFreed = 0;
        watching = true;
    }
    ~MessageWipingTest() override { watching = false; }

    static std::string shortSecret() { return std::string(kSecret); }
    static std::string longSecret() { return std::string(100, '.') + std::string(kSecret); }
    static Bytes secretBytes() { return Bytes(kSecret.begin(), kSecret.end()); }

    static Message secretMessage() {
        Message message;
        message.set("short", shortSecret());
        message.set("long", longSecret());
        message.set("bytes", secretBytes());
        return message;
    }
};

TEST_F(MessageWipingTest, WouldNoticeWhatIsLeftBehind) {
    { const auto heap = std::make_unique<std::vector<std::string>>(3, shortSecret()); }

    EXPECT_GT(secretsFreed, 0);
}

TEST_F(MessageWipingTest, LeavesNothingWhenItEnds) {
    { const Message message = secretMessage(); }

    EXPECT_EQ(secretsFreed, 0);
}

TEST_F(MessageWipingTest, LeavesNothingWhenItsEntriesMoveToALargerPlace) {
    Message message = secretMessage();
    for (int number = 0; number < 100; ++number)
        message.set("key" + std::to_string(number), shortSecret());

    EXPECT_EQ(secretsFreed, 0);
}

TEST_F(MessageWipingTest, LeavesNothingWhenAValueIsReplaced) {
    Message message = secretMessage();
    message.set("short", std::uint64_t{1});
    message.set("long", std::string(1000, 'x'));
    message.set("bytes", Bytes(1000));

    EXPECT_EQ(secretsFreed, 0);
}

TEST_F(MessageWipingTest, LeavesNothingWhenAnotherTakesItsPlace) {
    Message copiedOver = secretMessage();
    Message movedOver = secretMessage();
    const Message other = secretMessage();

    copiedOver = other;
    movedOver = Message();

    EXPECT_EQ(secretsFreed, 0);
}

TEST_F(MessageWipingTest, LeavesNothingBeyondTheEndOfATextThatWasCut) {
    {
        std::string text = longSecret();
        text.resize(10);
        Message message;
        message.set("cut", std::move(text));
    }

    EXPECT_EQ(secretsFreed, 0);
}

}  // namespace
}  // namespace vlm::platform
