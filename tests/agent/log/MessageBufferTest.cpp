#include "OrvLog/OrvMessageBuffer.h"

#include "Allocations.h"

#include <gtest/gtest.h>

#include <atomic>
#include <iomanip>
#include <locale>
#include <memory>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace {

using OrvLog::OrvMessageBuffer;

std::ostream& streamOf(OrvMessageBuffer& buffer) {
    return buffer;
}

TEST(MessageBufferTest, IsOnePointerWide) {
    EXPECT_EQ(sizeof(OrvMessageBuffer), sizeof(void*));
}

TEST(MessageBufferTest, HandsOverWhatWasStreamedAndIsEmptyAfterwards) {
    OrvMessageBuffer buffer;
    EXPECT_EQ(OrvMessageBuffer::str(buffer << "first "
                                           << "text"),
              "first text");
    EXPECT_EQ(OrvMessageBuffer::str(buffer), "");
    EXPECT_EQ(OrvMessageBuffer::str(buffer << "second"), "second");
}

TEST(MessageBufferTest, StreamsWhatStandardStreamsStream) {
    OrvMessageBuffer buffer;
    streamOf(buffer) << "number " << 42 << ' ' << 2.5 << ' ' << std::string("text");
    EXPECT_EQ(OrvMessageBuffer::str(buffer), "number 42 2.5 text");
}

TEST(MessageBufferTest, HandsOverThroughItsStream) {
    OrvMessageBuffer buffer;
    EXPECT_EQ(OrvMessageBuffer::str(streamOf(buffer) << "text" << 1), "text1");
    EXPECT_EQ(OrvMessageBuffer::str(streamOf(buffer)), "");
}

TEST(MessageBufferTest, TextsOfAStreamAndOfTheBufferAreOneText) {
    OrvMessageBuffer buffer;
    buffer << "a";
    streamOf(buffer) << 1;
    buffer << "b";
    EXPECT_EQ(OrvMessageBuffer::str(buffer), "a1b");
}

TEST(MessageBufferTest, StreamsThePointersThemselves) {
    const int object = 0;
    std::ostringstream expected;
    expected << " _broker=" << static_cast<const void*>(&object);

    OrvMessageBuffer buffer;
    EXPECT_EQ(OrvMessageBuffer::str(buffer << " _broker=" << &object), expected.str());
}

TEST(MessageBufferTest, ATextStaysUntilTheNextHandOver) {
    OrvMessageBuffer buffer;
    const std::string& text = OrvMessageBuffer::str(buffer << "first");
    buffer << "second";
    EXPECT_EQ(text, "first");
}

TEST(MessageBufferTest, ANullTextEndsATextAndTheNextOneIsWholeAgain) {
    const char* const none = nullptr;
    OrvMessageBuffer buffer;
    EXPECT_EQ(OrvMessageBuffer::str(buffer << "before" << none << "after"), "before");
    EXPECT_EQ(OrvMessageBuffer::str(buffer << "next"), "next");
}

TEST(MessageBufferTest, AStreamOfSomebodyElseHasNoText) {
    std::ostringstream stream;
    stream << "text";
    EXPECT_EQ(OrvMessageBuffer::str(stream), "");
    EXPECT_EQ(stream.str(), "text");
}

TEST(MessageBufferTest, ANewBufferKnowsNothingOfTheOneBefore) {
    {
        OrvMessageBuffer buffer;
        const char* const none = nullptr;
        streamOf(buffer) << std::hex << std::showbase << std::setfill('*') << std::setprecision(2) << std::setw(9);
        buffer << "left over" << none;
    }
    OrvMessageBuffer buffer;
    streamOf(buffer) << 255 << ' ' << 1.2345 << std::setw(3) << 1;
    EXPECT_EQ(OrvMessageBuffer::str(buffer), "255 1.2345  1");
}

TEST(MessageBufferTest, TheGlobalLocaleOfTheProgramDoesNotChangeNumbers) {
    struct Grouping : std::numpunct<char> {
        char do_thousands_sep() const override { return '.'; }
        std::string do_grouping() const override { return "\3"; }
    };
    const std::locale before = std::locale::global(std::locale(std::locale::classic(), new Grouping));
    // More than the pool keeps, so that some are made new.
    std::vector<std::unique_ptr<OrvMessageBuffer>> buffers(40);
    for (auto& buffer : buffers) {
        buffer = std::make_unique<OrvMessageBuffer>();
        EXPECT_EQ(OrvMessageBuffer::str(streamOf(*buffer) << 1234567), "1234567");
    }
    std::locale::global(before);
}

TEST(MessageBufferTest, BuffersThatLiveTogetherHaveTheirOwnTexts) {
    OrvMessageBuffer first;
    OrvMessageBuffer second;
    first << "first";
    second << "second";
    EXPECT_EQ(OrvMessageBuffer::str(first), "first");
    EXPECT_EQ(OrvMessageBuffer::str(second), "second");
}

TEST(MessageBufferTest, ThreadsDoNotShareBuffers) {
    std::vector<std::thread> threads;
    std::atomic<int> wrong = 0;
    for (int number = 0; number < 8; ++number) {
        threads.emplace_back([number, &wrong] {
            const std::string expected = "thread " + std::to_string(number);
            for (int round = 0; round < 2000; ++round) {
                OrvMessageBuffer buffer;
                streamOf(buffer) << "thread " << number;
                wrong += OrvMessageBuffer::str(buffer) != expected;
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

TEST(MessageBufferTest, RecordAfterRecordAllocatesNothing) {
    const std::string text(500, 'x');
    const auto makeRecord = [&text] {
        OrvMessageBuffer buffer;
        OrvMessageBuffer::str(buffer << text.c_str());
        streamOf(buffer) << text << 1;
        OrvMessageBuffer::str(buffer);
    };
    makeRecord();
    const int before = LogTest::allocations();
    for (int round = 0; round < 1000; ++round) {
        makeRecord();
    }
    EXPECT_EQ(LogTest::allocations(), before);
}

} // namespace
