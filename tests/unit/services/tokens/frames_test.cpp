#include "services/hints/tokens/frames.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>

namespace vlm::service {
namespace {

class FramesTest : public testing::Test {
protected:
    FramesTest() { EXPECT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, _ends.data()), 0); }
    ~FramesTest() override {
        closeOurs();
        close(_ends[1]);
    }
    int ours() const { return _ends[0]; }
    int theirs() const { return _ends[1]; }
    void closeOurs() {
        if (_ends[0] >= 0) close(_ends[0]);
        _ends[0] = -1;
    }
    void sendRaw(const Bytes& bytes) {
        ASSERT_EQ(write(ours(), bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
    }

private:
    std::array<int, 2> _ends{};
};

TEST_F(FramesTest, ArriveAsTheyWereWritten) {
    const Bytes content = {1, 2, 3};
    ASSERT_TRUE(writeFrame(ours(), content));
    ASSERT_TRUE(writeFrame(ours(), Bytes{}));

    EXPECT_EQ(readFrame(theirs()), content);
    EXPECT_EQ(readFrame(theirs()), Bytes{});
}

TEST_F(FramesTest, CarryASecretBehindTheContent) {
    const Secret secret("1234");
    ASSERT_TRUE(sendFrames(ours(), Bytes{7}, &secret));

    EXPECT_EQ(readFrame(theirs()), Bytes{7});
    const auto received = readSecretFrame(theirs(), 4);
    ASSERT_TRUE(received);
    EXPECT_EQ(received->text(), "1234");
}

TEST_F(FramesTest, OfASecretThatIsTooLongAreNotTaken) {
    const Secret secret("12345");
    ASSERT_TRUE(sendFrames(ours(), Bytes{7}, &secret));
    readFrame(theirs());

    EXPECT_FALSE(readSecretFrame(theirs(), 4));
}

TEST_F(FramesTest, EndWithTheStream) {
    sendRaw({4, 0, 0, 0, 1, 2});
    closeOurs();

    EXPECT_FALSE(readFrame(theirs()));
}

TEST_F(FramesTest, ThatAreTooLongAreNotTaken) {
    sendRaw({1, 0, 0, 1});  // one byte more than 16 MiB

    EXPECT_FALSE(readFrame(theirs()));
}

TEST_F(FramesTest, DoNotWaitForRoom) {
    const Bytes large(std::size_t{8} << 20U);

    EXPECT_FALSE(sendFrames(ours(), large, nullptr));
}

TEST_F(FramesTest, ToNobodyAreAnErrorAndNoSignal) {
    shutdown(theirs(), SHUT_RDWR);

    EXPECT_FALSE(writeFrame(ours(), Bytes{1}));
    EXPECT_FALSE(sendFrames(ours(), Bytes{1}, nullptr));
}

TEST(FrameAssemblerTest, PutsPiecesTogetherByteByByte) {
    FrameAssembler assembler;
    const Bytes stream = {2, 0, 0, 0, 8, 9, 0, 0, 0, 0, 1};

    for (std::size_t i = 0; i < 5; ++i)
        ASSERT_EQ(assembler.add(std::span(stream).subspan(i, 1)), FrameState::Incomplete);
    ASSERT_EQ(assembler.add(std::span(stream).subspan(5)), FrameState::Complete);

    EXPECT_EQ(assembler.take(), (Bytes{8, 9}));
    EXPECT_EQ(assembler.add({}), FrameState::Complete);
    EXPECT_EQ(assembler.take(), Bytes{});
    EXPECT_EQ(assembler.add({}), FrameState::Incomplete);
}

TEST(FrameAssemblerTest, RefusesAFrameThatIsTooLongAtItsHeader) {
    FrameAssembler assembler;

    EXPECT_EQ(assembler.add(Bytes{0, 0, 0, 1}), FrameState::Incomplete);
    EXPECT_EQ(FrameAssembler().add(Bytes{1, 0, 0, 1}), FrameState::TooLong);
    EXPECT_EQ(FrameAssembler().add(Bytes{255, 255, 255, 255}), FrameState::TooLong);
}

TEST(FrameAssemblerTest, TellsHowManyBytesItsFrameStillMisses) {
    FrameAssembler assembler;

    EXPECT_EQ(assembler.missing(), 4U);
    assembler.add(Bytes{2, 0});
    EXPECT_EQ(assembler.missing(), 2U);
    assembler.add(Bytes{0, 0});
    EXPECT_EQ(assembler.missing(), 2U);
    assembler.add(Bytes{8});
    EXPECT_EQ(assembler.missing(), 1U);
    EXPECT_EQ(assembler.add(Bytes{9}), FrameState::Complete);
    EXPECT_EQ(assembler.missing(), 0U);
    assembler.take();
    EXPECT_EQ(assembler.missing(), 4U);
}

// Puts as much of the stream where it belongs as there is room for, at most that many at once.
FrameState fill(SecretAssembler& assembler, Bytes stream, std::size_t atOnce) {
    auto state = FrameState::Incomplete;
    while (!stream.empty() && state == FrameState::Incomplete) {
        const auto room = assembler.room();
        const std::size_t size = std::min({room.size(), stream.size(), atOnce});
        std::copy_n(stream.begin(), size, room.begin());
        stream.erase(stream.begin(), stream.begin() + static_cast<std::ptrdiff_t>(size));
        state = assembler.filled(size);
    }
    return state;
}

TEST(SecretAssemblerTest, PutsPiecesTogether) {
    for (const std::size_t atOnce : {1, 2, 3, 100}) {
        SecretAssembler assembler(16);

        EXPECT_EQ(fill(assembler, {3, 0, 0, 0, 'a', 'b', 'c'}, atOnce), FrameState::Complete);
        EXPECT_EQ(assembler.take().text(), "abc");
    }
}

TEST(SecretAssemblerTest, TakesAnEmptySecretAndNoHalfOne) {
    SecretAssembler empty(16);
    SecretAssembler half(16);

    EXPECT_EQ(fill(empty, {0, 0, 0, 0}, 100), FrameState::Complete);
    EXPECT_TRUE(empty.take().empty());
    EXPECT_EQ(fill(half, {2, 0, 0, 0, 'a'}, 100), FrameState::Incomplete);
}

TEST(SecretAssemblerTest, RefusesAFrameThatIsTooLongAtItsHeader) {
    SecretAssembler most(16);
    SecretAssembler more(16);
    SecretAssembler absurd(16);

    EXPECT_EQ(fill(most, {16, 0, 0, 0}, 100), FrameState::Incomplete);
    EXPECT_EQ(fill(more, {17, 0, 0, 0}, 100), FrameState::TooLong);
    EXPECT_EQ(fill(absurd, {255, 255, 255, 255}, 100), FrameState::TooLong);
}

}  // namespace
}  // namespace vlm::service
