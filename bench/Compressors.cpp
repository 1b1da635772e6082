// General compressors on a list's text.

#include <lzma.h>
#include <zstd.h>

#include <cstdint>
#include <stdexcept>
#include <string>

#include "bench/Subject.hpp"
#include "bench/Timing.hpp"

namespace bench {

namespace {

constexpr int zstdLevel = 19;
constexpr std::uint32_t xzPreset = 6;

void require(bool fine, const char* who) {
    if (!fine) {
        throw std::runtime_error(std::string(who) +
                                 " did not give the text back.");
    }
}

std::string zstdPacked(const std::string& text) {
    std::string packed(ZSTD_compressBound(text.size()), '\0');
    const std::size_t size = ZSTD_compress(packed.data(), packed.size(),
                                           text.data(), text.size(), zstdLevel);
    require(ZSTD_isError(size) == 0, "zstd");
    packed.resize(size);
    return packed;
}

std::string zstdUnpacked(const std::string& packed, std::size_t size) {
    std::string text(size, '\0');
    text.resize(ZSTD_decompress(text.data(), text.size(), packed.data(),
                                packed.size()));
    return text;
}

std::uint8_t* bytesOf(std::string& text) {
    return reinterpret_cast<std::uint8_t*>(text.data());
}

const std::uint8_t* bytesOf(const std::string& text) {
    return reinterpret_cast<const std::uint8_t*>(text.data());
}

std::string xzPacked(const std::string& text) {
    std::string packed(lzma_stream_buffer_bound(text.size()), '\0');
    std::size_t size = 0;
    require(lzma_easy_buffer_encode(xzPreset, LZMA_CHECK_CRC64, nullptr,
                                    bytesOf(text), text.size(), bytesOf(packed),
                                    &size, packed.size()) == LZMA_OK,
            "xz");
    packed.resize(size);
    return packed;
}

std::string xzUnpacked(const std::string& packed, std::size_t size) {
    std::string text(size, '\0');
    std::uint64_t memoryLimit = UINT64_MAX;
    std::size_t read = 0;
    std::size_t written = 0;
    require(lzma_stream_buffer_decode(&memoryLimit, 0, nullptr, bytesOf(packed),
                                      &read, packed.size(), bytesOf(text),
                                      &written, text.size()) == LZMA_OK,
            "xz");
    text.resize(written);
    return text;
}

template <class Pack, class Unpack>
Compressed measured(const char* name, const std::string& text, Pack pack,
                    Unpack unpack) {
    Compressed result;
    result.name = name;
    std::string packed;
    std::string back;
    result.storeSeconds = secondsOf([&] { packed = pack(text); });
    result.restoreSeconds =
        secondsOf([&] { back = unpack(packed, text.size()); });
    require(back == text, name);
    result.bytes = packed.size();
    return result;
}

}  // namespace

std::vector<Compressed> compressText(const tessel::paths::PathList& list) {
    std::string text;
    text.reserve(list.textBytes() + list.size());
    for (std::size_t i = 0; i < list.size(); ++i) {
        text.append(list[i]).push_back('\n');
    }
    return {measured("zstd -19", text, zstdPacked, zstdUnpacked),
            measured("xz -6", text, xzPacked, xzUnpacked)};
}

}  // namespace bench
