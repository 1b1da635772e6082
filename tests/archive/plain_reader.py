#!/usr/bin/python3
"""Usage: plain_reader.py ARCHIVE

Writes all paths of an archive in the order of their numbers, each followed by
a NUL byte. Ends with status 4 and one line if the archive is damaged.

This program was written from docs/archive-format.md alone. It reads every
byte and checks every rule that the document states, and is in no hurry: it
shows that the document suffices to write a reader in another language.
"""

import struct
import sys

import xxhash

MAGIC = bytes.fromhex("8954534C0D0A1A0A")
SEGMENT_TAG = bytes.fromhex("54534547")
HEADER_BYTES = 64
ENTRY_BYTES = 40
HEAD_BYTES = 256
MAX_LENGTH = 1 << 20
MAX_TOKEN_TEXT = 262144

(TOKEN_CODES, FIRST_TOKEN_CODES, REPLACED_CODES, OPERATION_CODES,
 TOKEN_ENTRIES, TOKEN_TEXT, FOLDER_HEADS, NAME_GROUPS, FOLDER_GROUPS,
 WIDE_GROUPS, NAMES, FOLDERS, ORDER, INDEX) = range(14)
SORTED, AS_GIVEN, REARRANGED = range(3)

LONG_PREFIX, NEXT_FOLDER, JUMP = 125, 126, 127
OPERATION_RANGES = (0, 2, 4, 6, 8, 10, 12, 15, 19, 24, 31, 41, 55)


class Damaged(Exception):
    """The archive breaks a rule; the text says which."""


def require(condition, what):
    if not condition:
        raise Damaged(what)


def checksum(data, seed):
    return xxhash.xxh64_intdigest(data, seed)


# ---- Integers and bits ----


class Bytes:
    """Reads integers one after another and must be used up exactly."""

    def __init__(self, data):
        self.data = data
        self.at = 0

    def take(self, count):
        require(self.at + count <= len(self.data), "a section ends too early")
        self.at += count
        return self.data[self.at - count:self.at]

    def byte(self):
        return self.take(1)[0]

    def varint(self):
        value = 0
        for i in range(5):
            byte = self.byte()
            value |= (byte & 0x7F) << (7 * i)
            if byte < 0x80:
                require(value < 1 << 32, "a varint is too large")
                return value
        raise Damaged("a varint is too long")

    def end(self):
        require(self.at == len(self.data), "a section is not used up")


class Bits:
    """Reads bits, the most significant one of each byte first."""

    def __init__(self, data, offset):
        self.data = data
        self.at = 8 * offset

    def bit(self):
        require(self.at < 8 * len(self.data), "bits end too early")
        byte = self.data[self.at >> 3]
        self.at += 1
        return byte >> (7 - ((self.at - 1) & 7)) & 1

    def number(self, count):
        value = 0
        for _ in range(count):
            value = 2 * value + self.bit()
        return value

    def long_prefix(self):
        """A prefix length above 124, after its symbol."""
        zeros = 0
        while self.bit() == 0:
            zeros += 1
            require(zeros <= 20, "a prefix length has too many bits")
        return 124 + ((1 << zeros) | self.number(zeros))

    def byte_end(self):
        """The offset of the first byte not begun."""
        return (self.at + 7) >> 3


class Code:
    """A canonical Huffman code. symbols: pairs of length and symbol."""

    def __init__(self, symbols):
        self.only = symbols[0][1] if len(symbols) == 1 else None
        self.symbols = {}
        self.empty = not symbols
        if len(symbols) < 2:
            return
        number, before = 0, 0
        for length, symbol in sorted(symbols, key=lambda pair: pair[0]):
            number <<= length - before
            before = length
            self.symbols[length, number] = symbol
            number += 1
        require(number == 1 << before, "a code is not complete")

    def read(self, bits):
        require(not self.empty, "a code without symbols is needed")
        if self.only is not None:
            return self.only
        length, number = 0, 0
        while True:
            number = 2 * number + bits.bit()
            length += 1
            symbol = self.symbols.get((length, number))
            if symbol is not None:
                return symbol


def length_table(data, max_length):
    first, last = data.byte(), data.byte()
    if first > last:
        return Code([])
    if first == last:
        return Code([(0, first)])
    lengths = []
    for byte in data.take((last - first) // 2 + 1):
        lengths += [byte & 15, byte >> 4]
    symbols = [(length, first + i)
               for i, length in enumerate(lengths[:last - first + 1])
               if length]
    require(len(symbols) >= 2, "a length table has fewer than two symbols")
    require(max(symbols)[0] <= max_length, "a code is too long")
    return Code(symbols)


class Tokens:
    """The token codes of a segment: entries are (text, ends)."""

    def __init__(self, codes, first_codes, entries, text):
        require(len(text) <= MAX_TOKEN_TEXT, "the token text is too long")
        self.entries = self.decode_entries(entries, text)
        self.used = 0
        data = Bytes(codes)
        self.codes = [self.count_table(data) for _ in range(7)]
        data.end()
        data = Bytes(first_codes)
        present = data.take(32)
        self.first_codes = {c: self.count_table(data) for c in range(256)
                            if present[c // 8] >> (c % 8) & 1}
        data.end()
        require(self.used == len(self.entries), "token entries are left over")

    @staticmethod
    def decode_entries(entries, text):
        require(len(entries) % 3 == 0, "half a token entry")
        result = []
        for i in range(0, len(entries), 3):
            value = int.from_bytes(entries[i:i + 3], "little")
            offset, length, ends = value >> 6, value >> 1 & 31, value & 1
            require(offset + length <= len(text),
                    "a token is outside the text")
            result.append((text[offset:offset + length], ends == 1))
        return result

    def count_table(self, data):
        longest = data.byte()
        require(longest <= 24, "a token code is too long")
        if longest == 0:
            counts = [(0, 1)]
        else:
            counts = [(i + 1, data.varint()) for i in range(longest)]
            require(counts[-1][1] != 0, "the last count is 0")
        total = sum(count for _, count in counts)
        require(self.used + total <= len(self.entries),
                "token entries are missing")
        symbols = []
        for length, count in counts:
            for _ in range(count):
                symbols.append((length, self.entries[self.used]))
                self.used += 1
        return Code(symbols)


def name_context(byte):
    if 0x30 <= byte <= 0x39:
        return 1
    if 0x61 <= byte <= 0x7A:
        return 2
    return 3 if 0x41 <= byte <= 0x5A or byte >= 0x80 else 4


def folder_context(piece):
    return 5 if not piece or piece[-1] == 0x2F else 6


def read_tokens(bits, tokens, piece, context_of, context, max_length):
    """Appends tokens to piece until one ends it."""
    while True:
        text, ends = tokens.codes[context].read(bits)
        if not text and not ends:  # the escape
            byte = bits.number(8)
            if byte == 0:
                return
            text = bytes([byte])
        piece += text
        require(len(piece) <= max_length, "a text is longer than announced")
        if ends:
            return
        context = context_of(piece)


# ---- Segments ----


class Segment:
    def __init__(self, data):
        require(len(data) >= HEAD_BYTES, "a segment is too short")
        head = data[:HEAD_BYTES]
        self.read_head(head, len(data))
        self.body = self.verified_body(data)
        self.cut_sections()
        self.tokens = Tokens(*self.sections[TOKEN_CODES:FIRST_TOKEN_CODES + 1],
                             *self.sections[TOKEN_ENTRIES:TOKEN_TEXT + 1])
        table = Bytes(self.sections[REPLACED_CODES])
        self.replaced = [length_table(table, 8) for _ in range(98)]
        table.end()
        table = Bytes(self.sections[OPERATION_CODES])
        self.operations = [length_table(table, 10) for _ in range(16)]
        self.folder_prefix = length_table(table, 10)
        self.jump = length_table(table, 10)
        table.end()

    def read_head(self, head, size):
        require(checksum(head[:248], 0) == struct.unpack("<Q", head[248:])[0],
                "a segment head's checksum is wrong")
        require(head[:4] == SEGMENT_TAG, "no segment")
        (self.order, self.names_per_block, self.folders_per_block,
         self.blocks_per_head, self.shift) = head[4:9]
        require(self.order <= 2, "unknown order")
        require(min(head[5:8]) >= 1, "a block is empty")
        require(9 <= self.shift <= 12, "bad piece size")
        require(not any(head[9:12]) and not any(head[176:240]),
                "reserved bytes are used")
        (self.folder_count, self.count, self.text_bytes, self.longest_name,
         self.longest_folder, self.size) = struct.unpack_from("<IQQIIQ", head,
                                                              12)
        require(1 <= self.count <= 8_000_000, "bad number of paths")
        require(1 <= self.folder_count <= self.count, "bad number of folders")
        require(max(self.longest_name, self.longest_folder) <= MAX_LENGTH,
                "a text is too long")
        require(self.size == size, "a segment's size is wrong")
        self.sizes = struct.unpack_from("<16Q", head, 48)
        require(self.sizes[14] == self.sizes[15] == 0, "unknown sections")
        require(max(self.sizes) <= 1 << 40, "a section is too large")
        self.top = struct.unpack_from("<Q", head, 240)[0]

    def verified_body(self, data):
        padded = sum(-(-size // 8) * 8 for size in self.sizes)
        body_size = padded + 32
        piece = 1 << self.shift
        counts = [-(-body_size // piece)]
        while counts[-1] > 1:
            counts.append(-(-8 * counts[-1] // piece))
        levels = counts[:-1]
        require(HEAD_BYTES + 8 * sum(levels) + body_size == len(data),
                "sections do not fill their segment")
        expected = [self.top]
        at = HEAD_BYTES
        for level in range(len(levels), -1, -1):
            size = 8 * levels[level - 1] if level else body_size
            table = data[at:at + size]
            at += size
            sums = [checksum(table[i:i + piece], (level << 32) + i // piece)
                    for i in range(0, size, piece)]
            require(sums == expected, f"a checksum of level {level} is wrong")
            if level:
                expected = list(struct.unpack(f"<{levels[level - 1]}Q", table))
        return table

    def cut_sections(self):
        self.sections = []
        at = 0
        for size in self.sizes:
            self.sections.append(self.body[at:at + size])
            padded = -(-size // 8) * 8
            require(not any(self.body[at + size:at + padded]),
                    "padding is not zero")
            at += padded
        require(not any(self.body[at:]), "padding is not zero")

    # ---- Blocks ----

    def groups(self, section, header, per_block, count):
        """For each block: its offset and size, and the group's other field
        and the block's (names only)."""
        data = self.sections[section]
        blocks = -(-count // per_block)
        step = header + (32 if header == 8 else 16)
        require(len(data) == -(-blocks // 16) * step, "wrong size of groups")
        result = []
        for group in range(len(data) // step):
            record = data[group * step:(group + 1) * step]
            word = struct.unpack_from("<I", record)[0]
            named, firsts = 0, bytes(16)
            if header == 8:
                named = struct.unpack_from("<I", record, 4)[0]
                firsts = record[8:24]
            lengths = record[-16:]
            if word >> 31:
                wide = struct.unpack_from("<I", lengths)[0]
                require(not any(lengths[4:]), "bytes after a wide index")
                table = self.sections[WIDE_GROUPS]
                require(64 * wide + 64 <= len(table), "no such wide group")
                lengths = struct.unpack_from("<16I", table, 64 * wide)
                require(max(lengths) > 255, "a wide group is not wide")
            offset = word & 0x7FFFFFFF
            for i in range(16):
                block = 16 * group + i
                if block >= blocks:
                    require(lengths[i] == 0 and firsts[i] == 0,
                            "a missing block has bytes")
                    continue
                result.append((offset, lengths[i], named))
                offset += lengths[i]
                named += firsts[i]
        return result

    def blocks(self, section, entries):
        """The same blocks, checked to follow each other without gaps."""
        at = 0
        for offset, length, named in entries:
            require(offset == at, "blocks do not follow each other")
            at += length
            yield offset, offset + length, named
        require(at == len(self.sections[section]), "bytes after the blocks")

    def read_folders(self):
        entries = self.groups(FOLDER_GROUPS, 4, self.folders_per_block,
                              self.folder_count)
        folders = []
        for begin, end, _ in self.blocks(FOLDERS, entries):
            bits = Bits(self.sections[FOLDERS], begin)
            before = b""
            left = self.folder_count - len(folders)
            for i in range(min(self.folders_per_block, left)):
                prefix = self.folder_prefix.read(bits)
                require(prefix <= 125, "no prefix length")
                if prefix == 125:
                    prefix = bits.long_prefix()
                require(prefix <= len(before) and (i > 0 or prefix == 0),
                        "a folder's prefix is too long")
                folder = bytearray(before[:prefix])
                read_tokens(bits, self.tokens, folder, folder_context,
                            folder_context(folder), self.longest_folder)
                require(not folder or folder[-1] == 0x2F,
                        "a folder does not end with a slash")
                before = bytes(folder)
                folders.append(before)
            require(bits.byte_end() == end, "a folder block's size is wrong")
        return folders

    def check_folder_heads(self):
        """The heads are those folders, each where it is first named."""
        data = self.sections[FOLDER_HEADS]
        if self.order == AS_GIVEN:
            require(not data, "a list as given has folder heads")
            return
        step = self.folders_per_block * self.blocks_per_head
        heads = list(range(0, self.folder_count, step))
        table = 8 * (len(heads) + 1)
        require(len(data) >= table, "folder heads are missing")
        fields = struct.unpack_from(f"<{table // 4}I", data)
        offsets, blocks = fields[::2], fields[1::2]
        text = data[table:]
        require(offsets[0] == 0 and offsets[-1] == len(text),
                "folder heads do not fill their section")
        require(blocks[-1] == -(-self.count // self.names_per_block),
                "folder heads count the blocks wrongly")
        for i, folder in enumerate(heads):
            require(text[offsets[i]:offsets[i + 1]] == self.folders[folder],
                    "a folder head is not its folder")
            require(blocks[i] == self.first_block[folder],
                    "a folder head names another block")

    def read_paths(self):
        """All paths as they are stored."""
        self.folders = folders = self.read_folders()
        self.first_block = {}
        entries = self.groups(NAME_GROUPS, 8, self.names_per_block, self.count)
        paths = []
        seen = 0
        for begin, end, named in self.blocks(NAMES, entries):
            require(named == seen, "folders are counted wrongly")
            left = self.count - len(paths)
            block = NameBlock(self, begin, seen)
            number = len(paths) // self.names_per_block
            for _ in range(min(self.names_per_block, left)):
                folder, name = block.next()
                self.first_block.setdefault(folder, number)
                paths.append(folders[folder] + name)
            seen = block.seen
            require(block.bits.byte_end() == end,
                    "a name block's size is wrong")
        require(seen == self.folder_count, "a folder is never named")
        return paths

    def numbers(self, section):
        width = max(1, (self.count - 1).bit_length())
        data = self.sections[section]
        require(len(data) == -(-width * self.count // 8), "wrong size of order")
        bits = Bits(data, 0)
        result = [bits.number(width) for _ in range(self.count)]
        require(sorted(result) == list(range(self.count)), "no permutation")
        return result

    def list(self):
        paths = self.read_paths()
        self.check_folder_heads()
        require(sum(map(len, paths)) == self.text_bytes,
                "bytes of text are counted wrongly")
        if self.order != AS_GIVEN:
            require(all(a <= b for a, b in zip(paths, paths[1:])),
                    "the stored list is not sorted")
        if self.order == REARRANGED:
            paths = [paths[k] for k in self.numbers(ORDER)]
        else:
            require(self.sizes[ORDER] == 0, "an order that is not needed")
        if self.sizes[INDEX]:
            require(self.order != SORTED, "an index that is not needed")
            require(self.numbers(INDEX) == sorted(range(self.count),
                                                  key=lambda i: paths[i]),
                    "the index is not the sorted list")
        return paths


class NameBlock:
    """Reads the names of one block: pairs of folder number and name."""

    def __init__(self, segment, begin, seen):
        self.segment = segment
        self.bits = Bits(segment.sections[NAMES], begin)
        self.seen = seen
        self.folder = seen - 1
        self.name = b""
        self.prefix_before = None  # of the operation before, if it was one
        self.context = 15

    def next(self):
        prefix = self.operation()
        if prefix == 0:
            name = bytearray()
            read_tokens(self.bits, self.segment.tokens, name, self.after, 0,
                        self.segment.longest_name)
        else:
            name = self.shortened(prefix)
        require(0 <= self.folder < self.segment.folder_count,
                "no such folder")
        require(len(name) <= self.segment.longest_name, "a name is too long")
        self.name = bytes(name)
        return self.folder, self.name

    @staticmethod
    def after(name):
        return name_context(name[-1]) if name else 0

    def operation(self):
        """Sets the folder and returns the prefix length."""
        symbol = self.segment.operations[self.context].read(self.bits)
        first = self.context == 15
        if symbol in (NEXT_FOLDER, JUMP):
            self.change_folder(symbol)
            self.context, self.prefix_before = 0, None
            return 0
        before = self.prefix_before
        if symbol == LONG_PREFIX:
            prefix = self.bits.long_prefix()
        elif before is not None and before <= 124 and symbol <= before:
            prefix = before if symbol == 0 else symbol - 1
        else:
            prefix = symbol
        require(prefix <= len(self.name) and not (first and prefix),
                "a name's prefix is too long")
        self.prefix_before = prefix
        self.context = next((i + 1 for i, most in enumerate(OPERATION_RANGES)
                             if prefix <= most), 14)
        return prefix

    def change_folder(self, symbol):
        if symbol == NEXT_FOLDER:
            self.folder = self.seen
            self.seen += 1
            require(self.seen <= self.segment.folder_count,
                    "all folders are named already")
            return
        k = self.segment.jump.read(self.bits)
        require(k <= 22, "a jump is too far")
        distance = (1 << k) + self.bits.number(k)
        require(distance <= self.seen, "a jump leads before the first folder")
        self.folder = self.seen - distance

    def shortened(self, prefix):
        name = bytearray(self.name[:prefix])
        if prefix == len(self.name):
            context = 97
        else:
            byte = self.name[prefix]
            context = byte - 0x20 if 0x20 <= byte <= 0x7F else 96
        byte = self.segment.replaced[context].read(self.bits)
        if byte == 0:
            return name
        require(byte in self.segment.tokens.first_codes,
                "no first token for this byte")
        text, ends = self.segment.tokens.first_codes[byte].read(self.bits)
        name += text if text or ends else bytes([byte])
        if not ends:
            read_tokens(self.bits, self.segment.tokens, name, self.after,
                        self.after(name), self.segment.longest_name)
        return name


# ---- Files ----


def read_archive(data):
    """All paths of an archive, in the order of their numbers."""
    require(len(data) >= HEADER_BYTES and data[:8] == MAGIC, "no archive")
    header = data[:HEADER_BYTES]
    require(checksum(header[:56], 0) == struct.unpack("<Q", header[56:])[0],
            "the header's checksum is wrong")
    (version, zero, size, paths, segments, directory,
     reserved) = struct.unpack("<IIQQQQQ", header[8:56])
    require(version != 0, "version 0")
    if version > 1:
        sys.exit(f"version {version} is newer than this reader")
    require(zero == reserved == 0, "reserved bytes are used")
    require(size == len(data), "the file is cut or lengthened")
    require(directory + ENTRY_BYTES * segments == size,
            "the directory is misplaced")
    result = []
    at = HEADER_BYTES
    for i in range(segments):
        entry = data[directory + ENTRY_BYTES * i:][:ENTRY_BYTES]
        offset, length, first, count, total = struct.unpack("<5Q", entry)
        require(checksum(entry[:32], i) == total,
                "a directory entry's checksum is wrong")
        require(offset == at and first == len(result) and count >= 1,
                "a directory entry does not follow its predecessor")
        at += length
        require(at <= directory, "a segment is outside the file")
        segment = Segment(data[offset:offset + length])
        require(segment.count == count, "a segment has other paths")
        result += segment.list()
    require(at == directory, "a gap before the directory")
    require(len(result) == paths, "paths are counted wrongly")
    return result


def main():
    if len(sys.argv) != 2:
        print(__doc__.strip().split("\n", 1)[0], file=sys.stderr)
        return 2
    with open(sys.argv[1], "rb") as file:
        data = file.read()
    try:
        for path in read_archive(data):
            sys.stdout.buffer.write(path + b"\0")
    except Damaged as damage:
        print(f"{sys.argv[1]}: damaged: {damage}", file=sys.stderr)
        return 4
    return 0


if __name__ == "__main__":
    sys.exit(main())
