#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "archive/Format.hpp"

// Which code comes next: everything here follows from bytes and operations
// that a reader has already decoded. Part of the format.
namespace tessel::archive {

using ContextTable = std::array<std::uint8_t, 256>;

// ---- Tokens ----

// The token code is chosen by the byte before the token. Numbers are the
// places of the codes in section TokenCodes.
enum TokenContext : std::uint8_t {
    NameStart = 0,
    NameAfterDigit = 1,
    NameAfterLower = 2,
    NameAfterUpper = 3,  // or after a byte from 0x80 on
    NameAfterOther = 4,
    FolderStart = 5,  // or after '/'
    FolderInside = 6,
};
inline constexpr std::uint8_t tokenContextCount = 7;

constexpr TokenContext nameContextAfter(std::uint8_t byte) noexcept {
    if (byte >= '0' && byte <= '9') return NameAfterDigit;
    if (byte >= 'a' && byte <= 'z') return NameAfterLower;
    if ((byte >= 'A' && byte <= 'Z') || byte >= 0x80) return NameAfterUpper;
    return NameAfterOther;
}

constexpr TokenContext folderContextAfter(std::uint8_t byte) noexcept {
    return byte == '/' ? FolderStart : FolderInside;
}

inline constexpr ContextTable nameContexts = [] {
    ContextTable table{};
    for (unsigned c = 0; c < 256; ++c)
        table[c] = nameContextAfter(static_cast<std::uint8_t>(c));
    return table;
}();

inline constexpr ContextTable folderContexts = [] {
    ContextTable table{};
    for (unsigned c = 0; c < 256; ++c)
        table[c] = folderContextAfter(static_cast<std::uint8_t>(c));
    return table;
}();

// ---- Replaced bytes ----

// The first byte of a name after a shared prefix has a code of its own,
// chosen by the predecessor's byte at that place.
inline constexpr std::uint8_t replacedOther = 96;
inline constexpr std::uint8_t replacedEnd = 97;  // the predecessor ends there
inline constexpr std::uint8_t replacedContextCount = 98;

constexpr std::uint8_t replacedContext(std::uint8_t byte) noexcept {
    if (byte < 0x20 || byte >= 0x80) return replacedOther;
    return static_cast<std::uint8_t>(byte - 0x20);
}

inline constexpr ContextTable replacedContexts = [] {
    ContextTable table{};
    for (unsigned c = 0; c < 256; ++c)
        table[c] = replacedContext(static_cast<std::uint8_t>(c));
    return table;
}();

// ---- Operations ----

// The operation code is chosen by the operation of the previous name in the
// block. Numbers are the places of the codes in section OperationCodes.
inline constexpr std::uint8_t afterFolderOperation = 0;
inline constexpr std::uint8_t afterLongPrefix = 14;
inline constexpr std::uint8_t firstInBlock = 15;
inline constexpr std::uint8_t operationContextCount = 16;
// Two more codes of the same kind follow them.
inline constexpr std::uint8_t folderPrefixCode = 16;
inline constexpr std::uint8_t jumpCode = 17;
inline constexpr std::uint8_t operationCodeCount = 18;

constexpr std::uint8_t contextAfterOperation(unsigned operation) noexcept {
    if (operation >= operationNextFolder) return afterFolderOperation;
    // The last prefix length of contexts 1 to 13.
    constexpr std::array<std::uint8_t, 13> last = {0,  2,  4,  6,  8,  10, 12,
                                                   15, 19, 24, 31, 41, 55};
    for (std::size_t i = 0; i < last.size(); ++i)
        if (operation <= last[i]) return static_cast<std::uint8_t>(i + 1);
    return afterLongPrefix;
}

inline constexpr std::array<std::uint8_t, operationCount> operationContexts =
    [] {
        std::array<std::uint8_t, operationCount> table{};
        for (unsigned op = 0; op < operationCount; ++op)
            table[op] = contextAfterOperation(op);
        return table;
    }();

// Symbol 0 means "the same prefix length as the previous name": after a name
// with the short prefix p, the symbols of the lengths below p move up by one.
// `previous` is the previous operation, or operationNextFolder for the first
// name of a block.
constexpr unsigned symbolOfOperation(unsigned operation,
                                     unsigned previous) noexcept {
    if (operation > maxShortPrefix || previous > maxShortPrefix)
        return operation;
    if (operation == previous) return 0;
    return operation < previous ? operation + 1 : operation;
}

constexpr unsigned operationOfSymbol(unsigned symbol,
                                     unsigned previous) noexcept {
    if (symbol > maxShortPrefix || previous > maxShortPrefix) return symbol;
    if (symbol == 0) return previous;
    return symbol <= previous ? symbol - 1 : symbol;
}

}  // namespace tessel::archive
