// A zlib stream from outside, read while it is inflated.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <zlib.h>

#include <algorithm>
#include <optional>
#include <random>

#include "packing/Inflater.hpp"
#include "packing/sixpacks.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/ReferenceCode.hpp"

namespace {

using namespace tessel::sixpacks;
using support::Bytes;
using tessel::DamagedFormException;

// Reads the stream in pieces of at most `piece` bytes.
Bytes inflated(const Bytes& stream, std::uint64_t size,
               std::size_t piece = 1000) {
    Inflater inflater(stream, size);
    ByteCursor cursor(inflater);
    Bytes out;
    while (!cursor.empty()) {
        const auto bytes = cursor.take(std::min(piece, cursor.remaining()));
        out.insert(out.end(), bytes.begin(), bytes.end());
    }
    inflater.finish();
    return out;
}

// Longer than any window, and hard to compress at its beginning.
Bytes longText() {
    std::mt19937 random(1);
    Bytes data;
    while (data.size() < 100'000)
        data.push_back(static_cast<std::uint8_t>(random()));
    while (data.size() < 300'000)
        data.push_back(static_cast<std::uint8_t>('a' + random() % 3));
    return data;
}

Bytes streamOf(Bytes data) { return compressUint8(data); }

Bytes cutAt(const Bytes& bytes, std::size_t length) {
    return {bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(length)};
}

TEST(Inflater, AValidStreamOfTheExactSizeComesBack) {
    const Bytes stream = streamOf(longText());
    for (const std::size_t piece : {1U, 7U, 65'536U, 65'537U, 300'000U})
        EXPECT_EQ(inflated(stream, 300'000, piece), longText()) << piece;
    for (const Bytes& data : {Bytes(), Bytes{1}, Bytes(100'000, 7)})
        EXPECT_EQ(inflated(streamOf(data), data.size()), data);
}

TEST(Inflater, WhatNobodyReadsIsCheckedToo) {
    Bytes stream = streamOf(longText());
    const auto finishAfter = [&stream](std::size_t bytes) {
        Inflater inflater(stream, 300'000);
        ByteCursor(inflater).take(bytes);
        inflater.finish();
        EXPECT_EQ(inflater.remaining(), 0U);
    };
    for (const std::size_t bytes : {0U, 1U, 100'000U, 300'000U})
        EXPECT_NO_THROW(finishAfter(bytes)) << bytes;
    stream.back() ^= 1;
    for (const std::size_t bytes : {0U, 1U, 100'000U, 300'000U})
        EXPECT_THROW(finishAfter(bytes), DamagedFormException) << bytes;
}

TEST(Inflater, WantsTheExactSize) {
    for (const Bytes& data : {Bytes{1}, Bytes(500, 3), longText()}) {
        const Bytes stream = streamOf(data);
        for (const std::size_t size : {std::size_t{0}, data.size() - 1,
                                       data.size() + 1, data.size() * 2})
            EXPECT_THROW(inflated(stream, size), DamagedFormException) << size;
    }
}

TEST(Inflater, WantsAWholeStream) {
    const Bytes stream = streamOf(Bytes(5000, 9));
    for (std::size_t length = 0; length < stream.size(); ++length)
        EXPECT_THROW(inflated(cutAt(stream, length), 5000),
                     DamagedFormException);
}

TEST(Inflater, DamageStaysDamageAfterAReadHasMetIt) {
    const Bytes stream = cutAt(streamOf(longText()), 90'000);
    Inflater inflater(stream, 300'000);
    ByteCursor cursor(inflater);
    EXPECT_THROW(cursor.take(300'000), DamagedFormException);
    EXPECT_THROW(inflater.finish(), DamagedFormException);
    EXPECT_THROW(inflater.finish(), DamagedFormException);
}

TEST(Inflater, TheBestCompressionThatExistsIsAccepted) {
    const Bytes data(8 << 20, 0);
    const Bytes stream = streamOf(data);
    EXPECT_GT(data.size() / stream.size(), 1000U);
    EXPECT_EQ(inflated(stream, data.size()), data);
}

TEST(Inflater, ASizeThatNoStreamReachesIsRefused) {
    const Bytes stream = streamOf(Bytes(100, 0));
    EXPECT_NO_THROW(Inflater(stream, stream.size() * 1032));
    EXPECT_THROW(Inflater(stream, (stream.size() + 1) * 1032),
                 DamagedFormException);
    EXPECT_THROW(Inflater(stream, stream.size() * 1200), DamagedFormException);
    EXPECT_THROW(Inflater(stream, ~std::uint64_t{0}), DamagedFormException);
    EXPECT_THROW(inflated({}, 1), DamagedFormException);
    EXPECT_THROW(inflated({}, 0), DamagedFormException);
}

// What zlib makes of the whole stream at once; nothing if it refuses it.
std::optional<Bytes> atOnce(const Bytes& stream, std::size_t size) {
    Bytes out(size);
    uLongf length = size;
    if (uncompress(out.data(), &length, stream.data(), stream.size()) != Z_OK ||
        length != size)
        return std::nullopt;
    return out;
}

std::optional<Bytes> inPieces(const Bytes& stream, std::size_t size,
                              std::size_t piece) {
    try {
        return inflated(stream, size, piece);
    } catch (const DamagedFormException&) {
        return std::nullopt;
    }
}

// The stream as it is, or cut, longer, with another behind it, or with a byte
// changed.
Bytes anyVariantOf(Bytes stream) {
    const auto other = *rc::gen::container<Bytes>(support::anyByte());
    const auto position = *rc::gen::inRange<std::size_t>(0, stream.size());
    switch (*rc::gen::inRange(0, 5)) {
        case 0:
            return stream;
        case 1:
            return cutAt(stream, position);
        case 2:
            stream.insert(stream.end(), other.begin(), other.end());
            return stream;
        case 3: {
            const Bytes second = streamOf(other);
            stream.insert(stream.end(), second.begin(), second.end());
            return stream;
        }
        default:
            stream[position] ^= *rc::gen::inRange<std::uint8_t>(1, 255);
            return stream;
    }
}

RC_GTEST_PROP(InflaterProperties, AgreesWithInflatingAtOnce, ()) {
    const auto part = *rc::gen::container<Bytes>(support::anyByte());
    const auto repeats = *rc::gen::element<std::size_t>(1, 2, 100, 2000);
    Bytes data = {1};  // of no bytes, zlib at once takes one byte too many
    for (std::size_t i = 0; i < repeats; ++i)
        data.insert(data.end(), part.begin(), part.end());
    const Bytes stream = anyVariantOf(streamOf(data));
    const std::size_t size =
        data.size() - 1 + *rc::gen::element<std::size_t>(1, 1, 1, 0, 2);
    RC_PRE(size > 0U);
    const auto piece = *rc::gen::element<std::size_t>(1, 100, 1 << 16, 1 << 20);
    RC_ASSERT(inPieces(stream, size, piece) == atOnce(stream, size));
}

}  // namespace
