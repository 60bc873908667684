#include "services/hints/secret_pipe.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <array>
#include <string>

#include "platform/linux/owned_endpoint.h"

namespace vlm::service {
namespace {

using platform::Endpoint;
using platform::FileDescriptor;

std::optional<std::string> textIn(const Endpoint& pipe) {
    const auto secret = secretIn(pipe);
    if (!secret) return std::nullopt;
    return std::string(secret->text());
}

struct OpenPipe {
    OpenPipe() {
        std::array<int, 2> ends{};
        EXPECT_EQ(::pipe2(ends.data(), O_CLOEXEC), 0);
        reading = platform::ownedEndpoint(FileDescriptor(ends[0]));
        writing = FileDescriptor(ends[1]);
    }
    Endpoint reading;
    FileDescriptor writing;
};

TEST(SecretPipeTest, GivesTheSecretOnce) {
    const auto pipe = pipeHolding(Secret("correct horse"));
    ASSERT_TRUE(pipe);

    EXPECT_EQ(textIn(*pipe), "correct horse");
    EXPECT_EQ(textIn(*pipe), std::nullopt);
}

TEST(SecretPipeTest, TakesTheLongestSecretAndNoLongerOne) {
    const std::string longest(kMostSecretBytes, 'x');

    EXPECT_EQ(textIn(pipeHolding(Secret(longest)).value_or(Endpoint{})), longest);
    EXPECT_FALSE(pipeHolding(Secret(longest + "x")));
    EXPECT_FALSE(pipeHolding(Secret()));
}

TEST(SecretPipeTest, OneThatStaysOpenForWritingIsNotWaitedFor) {
    const OpenPipe pipe;
    ASSERT_EQ(::write(pipe.writing.get(), "half", 4), 4);

    EXPECT_EQ(textIn(pipe.reading), std::nullopt);
}

TEST(SecretPipeTest, OneThatHoldsTooMuchIsNone) {
    OpenPipe pipe;
    const std::string tooLong(kMostSecretBytes + 1, 'x');
    ASSERT_EQ(::write(pipe.writing.get(), tooLong.data(), tooLong.size()),
              static_cast<ssize_t>(tooLong.size()));
    pipe.writing = FileDescriptor();

    EXPECT_EQ(textIn(pipe.reading), std::nullopt);
}

TEST(SecretPipeTest, WhatIsNoPipeIsNone) {
    EXPECT_EQ(textIn(Endpoint{}), std::nullopt);
    EXPECT_EQ(textIn(platform::ownedEndpoint(FileDescriptor(::open("/dev/zero", O_RDONLY)))),
              std::nullopt);
}

}  // namespace
}  // namespace vlm::service
