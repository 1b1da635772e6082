// zlib without memory. This program answers for zlib itself.

#include <gtest/gtest.h>
#include <zlib.h>

#include <new>

#include "packing/Inflater.hpp"
#include "packing/sixpacks.hpp"

namespace {

bool zlibBegins = false;

}  // namespace

extern "C" {

int inflateInit_(z_streamp /*stream*/, const char* /*version*/, int /*size*/) {
    return zlibBegins ? Z_OK : Z_MEM_ERROR;
}

int inflate(z_streamp /*stream*/, int /*flush*/) { return Z_MEM_ERROR; }

int inflateEnd(z_streamp /*stream*/) { return Z_OK; }

int uncompress(Bytef* /*dest*/, uLongf* destLen, const Bytef* /*source*/,
               uLong /*sourceLen*/) {
    *destLen = 0;
    return Z_MEM_ERROR;
}

int compress2(Bytef* /*dest*/, uLongf* /*destLen*/, const Bytef* /*source*/,
              uLong /*sourceLen*/, int /*level*/) {
    return Z_MEM_ERROR;
}

}  // extern "C"

namespace {

using Bytes = std::vector<std::uint8_t>;

TEST(CompressionWithoutMemory, IsLackOfMemoryAndNotDamage) {
    const Bytes stream(20, 1);
    EXPECT_THROW(tessel::sixpacks::Inflater(stream, 10), std::bad_alloc);
    zlibBegins = true;
    tessel::sixpacks::Inflater inflater(stream, 10);
    EXPECT_THROW(tessel::sixpacks::ByteCursor(inflater).takeByte(),
                 std::bad_alloc);
    EXPECT_THROW(inflater.finish(), std::bad_alloc);
    Bytes data(20, 1);
    EXPECT_THROW(tessel::sixpacks::compressUint8(data), std::bad_alloc);
    EXPECT_EQ(data, Bytes(20, 1));
}

TEST(CompressionWithoutMemory, TheTrustingReaderGivesWhatThereIs) {
    const Bytes stream(20, 1);
    EXPECT_TRUE(
        tessel::sixpacks::decompressUint8(stream.begin(), 20, 10).empty());
}

}  // namespace
