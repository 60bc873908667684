// The socket of pcscd in a folder of the test's own.

#include "services/hints/pcscd_socket.h"

#include <gtest/gtest.h>
#include <poll.h>

#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {
namespace {

namespace fs = std::filesystem;

class PcscdSocketTest : public testing::Test {
protected:
    bool isTold() const {
        pollfd told{socket.descriptor(), POLLIN, 0};
        return poll(&told, 1, 0) == 1;
    }

    test::TemporaryFolder folder;
    PcscdSocket socket{folder.path() / "pcscd" / "pcscd.comm"};
};

TEST_F(PcscdSocketTest, TellsWhenTheSocketComes) {
    fs::create_directory(folder.path() / "pcscd");
    socket.watch();
    EXPECT_FALSE(isTold());

    folder.write("pcscd/pcscd.comm", "");

    EXPECT_TRUE(isTold());
}

TEST_F(PcscdSocketTest, TellsWhenTheFolderOfTheSocketComes) {
    socket.watch();
    EXPECT_FALSE(isTold());

    fs::create_directory(folder.path() / "pcscd");

    EXPECT_TRUE(isTold());
}

TEST_F(PcscdSocketTest, TellsWhenTheFolderOfTheSocketGoes) {
    fs::create_directory(folder.path() / "pcscd");
    socket.watch();

    fs::remove(folder.path() / "pcscd");

    EXPECT_TRUE(isTold()) << "what comes to another folder of that name would not be told";
}

TEST_F(PcscdSocketTest, TellsOnlyWhatComesAfterItWasAsked) {
    fs::create_directory(folder.path() / "pcscd");
    socket.watch();
    folder.write("pcscd/pcscd.comm", "");
    ASSERT_TRUE(isTold());

    socket.watch();

    EXPECT_TRUE(socket.isWatched());
    EXPECT_FALSE(isTold());
}

}  // namespace
}  // namespace vlm::service
