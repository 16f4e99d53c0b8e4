#include "ipc/progress_pipe.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstring>

#include "support/test_support.h"

namespace {

TEST(ProgressPipe, SendsTwelveByteMessagesToAListeningFrontEnd) {
    testing_support::TempDir dir;
    const std::string path = dir / "progress";
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    const int reader = ::open(path.c_str(), O_RDONLY | O_NONBLOCK);
    ASSERT_GE(reader, 0);

    orv::ProgressPipe pipe(path);
    ASSERT_TRUE(pipe.open());
    for (float percent : {25.0F, 50.0F, 75.0F, 100.0F}) pipe.sendProgress(percent);

    unsigned char bytes[64];
    ASSERT_EQ(::read(reader, bytes, sizeof bytes), 48);
    for (int i = 0; i < 4; ++i) {
        std::uint32_t code = 99;
        std::uint32_t length = 0;
        float percent = 0;
        std::memcpy(&code, bytes + 12 * i, 4);
        std::memcpy(&length, bytes + 12 * i + 4, 4);
        std::memcpy(&percent, bytes + 12 * i + 8, 4);
        EXPECT_EQ(code, 0U);
        EXPECT_EQ(length, 12U);
        EXPECT_EQ(percent, 25.0F * static_cast<float>(i + 1));
    }
    // A front end that goes away must not end the run.
    ::close(reader);
    pipe.sendProgress(10.0F);
    pipe.close();
}

TEST(ProgressPipe, NoNameNoFifoOrNoReaderMeansNoChannel) {
    testing_support::TempDir dir;
    orv::ProgressPipe unnamed("");
    EXPECT_FALSE(unnamed.open());
    unnamed.sendProgress(50.0F);  // silently nothing

    orv::ProgressPipe missing(dir / "missing");
    EXPECT_FALSE(missing.open());

    const std::string path = dir / "noreader";
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    orv::ProgressPipe noReader(path);
    EXPECT_FALSE(noReader.open());

    testing_support::writeFile(dir / "plain", "");
    orv::ProgressPipe plainFile(dir / "plain");
    EXPECT_FALSE(plainFile.open());

    EXPECT_EQ(platform::FifoWriter::pathFor("front"), "/tmp/front");
    EXPECT_EQ(platform::FifoWriter::pathFor("/run/x/front"), "/run/x/front");
}

}  // namespace
