// A zlib stream that is inflated ahead of its reader.

#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "packing/Inflater.hpp"
#include "packing/sixpacks.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/FewThreads.hpp"

namespace {

using namespace tessel::sixpacks;
using support::Bytes;
using tessel::DamagedFormException;

// Many windows of text.
Bytes text() {
    std::mt19937 random(1);
    Bytes data(3'000'000);
    for (auto& byte : data)
        byte = static_cast<std::uint8_t>('a' + random() % 20);
    return data;
}

Bytes streamOf(Bytes data) { return compressUint8(data); }

// Reads pieces of all sizes: shorter than what is kept for the next window,
// longer than that, and longer than a window.
Bytes readAll(Inflater& inflater) {
    ByteCursor cursor(inflater);
    Bytes out;
    for (std::size_t piece = 1; !cursor.empty();
         piece = piece > 700'000 ? 3 : piece * 3) {
        const auto bytes = cursor.take(std::min(piece, cursor.remaining()));
        out.insert(out.end(), bytes.begin(), bytes.end());
    }
    return out;
}

TEST(InflaterThreads, WindowsFollowEachOther) {
    const Bytes stream = streamOf(text());
    Inflater inflater(stream, text().size());
    EXPECT_TRUE(readAll(inflater) == text());
    inflater.finish();
    EXPECT_EQ(inflater.remaining(), 0U);
}

TEST(InflaterThreads, WithoutAThreadTheBytesAreTheSame) {
    const Bytes stream = streamOf(text());
    for (const int threads : {0, 1, 3}) {
        const support::FewThreads few(threads);
        Inflater inflater(stream, text().size());
        EXPECT_TRUE(readAll(inflater) == text()) << threads;
        inflater.finish();
    }
}

TEST(InflaterThreads, WhatTheThreadMeetsReachesTheReader) {
    Bytes stream = streamOf(text());
    stream[stream.size() / 2] ^= 1;
    for (const int threads : {0, 100}) {
        const support::FewThreads few(threads);
        Inflater inflater(stream, text().size());
        EXPECT_THROW((readAll(inflater), inflater.finish()),
                     DamagedFormException);
        EXPECT_THROW(inflater.finish(), DamagedFormException);
    }
}

TEST(InflaterThreads, OneThatIsNotReadToItsEndWaitsForItsThread) {
    const Bytes stream = streamOf(text());
    const std::size_t half = text().size() / 2;
    for (int i = 0; i < 20; ++i) {
        Inflater inflater(stream, text().size());
        ByteCursor(inflater).takeByte();
        EXPECT_GT(inflater.remaining(), half);
    }
}

}  // namespace
