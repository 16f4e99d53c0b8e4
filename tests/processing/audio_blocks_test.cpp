// Audio blocks: what the driver gathers into them, and how they are handed to the workers.
#include <gtest/gtest.h>

#include <atomic>
#include <condition_variable>
#include <thread>

#include "processing/session_audio.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace {

using namespace testing_support;
using orv::AudioBlock;
using orv::AudioDispatcher;

TEST(WorkerCount, PhysicalCoresPlusLogicalProcessorsAtLeastTwo) {
    EXPECT_EQ(orv::countWorkerThreads(1, 1), 2U);
    EXPECT_EQ(orv::countWorkerThreads(0, 1), 2U);
    EXPECT_EQ(orv::countWorkerThreads(4, 8), 12U);
}

AudioDispatcher::Options limits(unsigned workerLimit, AudioDispatcher::ResidentBytes resident = {},
                                bool reverse = false) {
    AudioDispatcher::Options o;
    o.workerLimit = workerLimit;
    o.residentBytes = std::move(resident);
    o.reverseOrder = reverse;
    return o;
}

std::unique_ptr<AudioBlock> blockOf(std::size_t periods) {
    auto b = std::make_unique<AudioBlock>();
    b->marks.assign(periods, 0);
    return b;
}

// Work items that wait until released, counting how many run at once.
struct Gate {
    std::mutex mutex;
    std::condition_variable cv;
    bool open = false;
    std::atomic<int> running{0};
    std::vector<std::uint64_t> order;
    void operator()(AudioBlock& b) {
        ++running;
        std::unique_lock<std::mutex> lock(mutex);
        cv.wait(lock, [this] { return open; });
        order.push_back(b.sequence);
        --running;
    }
    void release() {
        {
            std::lock_guard<std::mutex> lock(mutex);
            open = true;
        }
        cv.notify_all();
    }
};

TEST(Dispatcher, KeepsAtMostTheLimitPlusOneInFlight) {
    platform::ThreadPool pool(8);
    Gate gate;
    AudioDispatcher d(
        pool, [&](AudioBlock& b) { gate(b); }, limits(1));
    std::thread driver([&] {
        for (int i = 0; i < 6; ++i) d.dispatch(blockOf(1));
        d.dispatch(blockOf(0));  // no audio: not a work item
    });
    while (gate.running < 2) std::this_thread::yield();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_EQ(gate.running, 2);  // the third waits in dispatch
    gate.release();
    driver.join();
    d.waitForAll();
    EXPECT_EQ(d.peakInFlight(), 2U);
    EXPECT_EQ(gate.order.size(), 6U);
    EXPECT_EQ(d.dispatchedCount(), 6U);
}

TEST(Dispatcher, MemoryGuardWaitsForWorkButNeverForNothing) {
    platform::ThreadPool pool(4);
    Gate gate;
    gate.release();
    std::atomic<std::uint64_t> resident{2 * AudioDispatcher::kMemoryLimit};
    AudioDispatcher d(
        pool, [&](AudioBlock& b) { gate(b); }, limits(3, [&] { return resident.load(); }));
    for (int i = 0; i < 5; ++i) d.dispatch(blockOf(1));  // would hang without the way out
    d.waitForAll();
    EXPECT_EQ(d.peakInFlight(), 1U);
    resident = 0;
    Gate held;
    AudioDispatcher e(
        pool, [&](AudioBlock& b) { held(b); }, limits(3, [&] { return resident.load(); }));
    for (int i = 0; i < 4; ++i) e.dispatch(blockOf(1));
    held.release();
    e.waitForAll();
    EXPECT_EQ(e.peakInFlight(), 4U);
}

TEST(Dispatcher, ReverseOrderRunsTheLastBlockFirst) {
    platform::ThreadPool pool(1);
    Gate gate;
    gate.release();
    AudioDispatcher d(
        pool, [&](AudioBlock& b) { gate(b); }, limits(2, {}, true));
    for (int i = 0; i < 4; ++i) d.dispatch(blockOf(2));
    d.waitForAll();
    EXPECT_EQ(gate.order, (std::vector<std::uint64_t>{3, 2, 1, 0}));
}

// A session fed record by record, its dispatched blocks captured with their audio.
class Blocks : public ::testing::Test {
protected:
    struct Captured {
        std::uint64_t sequence;
        platform::SystemTime time;
        std::vector<std::int16_t> samples, preRoll;
        std::vector<std::uint32_t> marks;
        float minBattery;
        std::uint32_t status;
    };

    void addWave(const std::string& name, const std::vector<std::int16_t>& samples) {
        writeWaveFile(dir_ / ("data.000/" + name), samples);
        session_.waveFiles.push_back("data.000/" + name);
    }
    orv::SessionAudio& audio() {
        if (!audio_) {
            session_.sessionPath = dir_.path() + "/";
            orv::SessionAudio::Options options;
            options.preRollSeconds = 3;
            audio_ = std::make_unique<orv::SessionAudio>(
                session_, pool_, [this](AudioBlock& b) { capture(b); }, nullptr, options, console_);
        }
        return *audio_;
    }
    void capture(AudioBlock& b) {
        Captured c{b.sequence, b.time, {}, {}, b.marks, b.minBattery, b.statusFlags};
        c.samples.resize(b.sampleCount());
        c.preRoll.resize(b.preRoll.samples());
        EXPECT_TRUE(b.audio.read(0, c.samples.size(), c.samples.data()));
        EXPECT_TRUE(b.preRoll.read(0, c.preRoll.size(), c.preRoll.data()));
        std::lock_guard<std::mutex> lock(mutex_);
        blocks_.push_back(std::move(c));
    }
    // Records from 08:30:00.1 of 17/09/2020 on; `boundaryEvery` records close an interval.
    void feed(std::size_t count, std::size_t boundaryEvery,
              const std::function<void(std::size_t, orv::LevelRecord&)>& fill = {}) {
        orv::DataFileHeader h;
        h.day = 17;
        h.month = 9;
        h.year = 2020;
        h.hour = 8;
        for (std::size_t i = 0; i < count; ++i) {
            const std::size_t slot = 30 * 600 + 1 + i;
            orv::LevelRecord r;
            r.minute = static_cast<std::uint16_t>(slot / 600);
            r.second = static_cast<std::uint16_t>(slot / 10 % 60);
            r.tenth = static_cast<std::uint16_t>(slot % 10);
            r.battery = 12.5F;
            if (fill) fill(i, r);
            audio().step(r, h, (i + 1) % boundaryEvery == 0);
        }
        audio().finish();
        std::sort(blocks_.begin(), blocks_.end(),
                  [](const Captured& a, const Captured& b) { return a.sequence < b.sequence; });
    }

    TempDir dir_;
    orv::SessionRecord session_;
    platform::ThreadPool pool_{2};
    std::string printed_;
    platform::Console console_{&printed_};
    std::unique_ptr<orv::SessionAudio> audio_;
    std::mutex mutex_;
    std::vector<Captured> blocks_;
};

TEST_F(Blocks, EachBlockHoldsExactlyTheAudioOfItsRecords) {
    // 7 s of audio in two files (the first ends inside the second block); intervals of
    // 3 s; the records go on for 11 s, past the audio.
    const auto a = markedSamples(1, 4 * 48000);
    const auto b = markedSamples(2, 3 * 48000);
    addWave("20200917_083000.wav", a);
    addWave("20200917_083004.wav", b);
    std::vector<std::int16_t> all(a);
    all.insert(all.end(), b.begin(), b.end());
    feed(110, 30, [](std::size_t i, orv::LevelRecord& r) {
        r.cond2Mark = i == 40 ? 1 : 0;
        r.status = i == 45 ? 1 : 0;
        if (i == 41) r.battery = 11.9F;
        if (i == 65) r.battery = 0.0F;  // a reading of 0 lowers it too
    });
    // Blocks at 3, 6 and 9 s; the third holds the last second of audio; the records after
    // it take none and the last, unfinished interval is dropped.
    ASSERT_EQ(blocks_.size(), 3U);
    const std::size_t periods[] = {30, 30, 10};
    for (std::size_t k = 0; k < 3; ++k) {
        const Captured& c = blocks_[k];
        const auto first = all.begin() + static_cast<std::ptrdiff_t>(k * 30 * 4800);
        EXPECT_TRUE(c.samples == std::vector<std::int16_t>(first, first + periods[k] * 4800)) << k;
        // The closing record stamps the block: 08:30:03.0, 08:30:06.0, 08:30:09.0.
        EXPECT_EQ(c.time.second, 3 * (k + 1));
        EXPECT_EQ(c.time.milliseconds, 0);
        // Pre-roll: the 3 s before the block, none for the first.
        EXPECT_TRUE(c.preRoll ==
                    std::vector<std::int16_t>(first - (k == 0 ? 0 : 30 * 4800), first));
    }
    EXPECT_EQ(blocks_[1].marks[10], 1U);
    EXPECT_EQ(blocks_[1].minBattery, 11.9F);
    EXPECT_EQ(blocks_[1].status, 1U);
    EXPECT_EQ(blocks_[0].minBattery, 12.5F);
    EXPECT_EQ(blocks_[0].status, 0U);
    EXPECT_EQ(blocks_[2].minBattery, 0.0F);
}

TEST_F(Blocks, TriggeredRecordingsEndTheirBlocks) {
    session_.triggerOn = 1;
    const auto a = markedSamples(1, 2 * 48000);
    const auto b = markedSamples(2, 48000);
    addWave("20200917_083001.wav", a);  // (08:30:01, 08:30:03]
    addWave("20200917_083004.wav", b);  // (08:30:04, 08:30:05]
    feed(60, 1000);                     // no statistics boundary
    ASSERT_EQ(blocks_.size(), 2U);
    EXPECT_TRUE(blocks_[0].samples == a);
    EXPECT_TRUE(blocks_[1].samples == b);
    // Stamped by the first record outside the range.
    EXPECT_EQ(blocks_[0].time.second, 3);
    EXPECT_EQ(blocks_[0].time.milliseconds, 1);
    EXPECT_TRUE(blocks_[1].preRoll.empty());
}

TEST_F(Blocks, ASessionWithoutWaveFilesSaysSo) {
    feed(40, 10);
    EXPECT_TRUE(blocks_.empty());
    EXPECT_EQ(printed_, "ERR: No wave files in " + dir_.path() +
                            "/ - no results from audio for this session\r\n");
}

}  // namespace
