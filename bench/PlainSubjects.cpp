// The plain ways to keep a list: vectors of strings, and one text buffer.

#include <cstdint>
#include <cstring>
#include <limits>
#include <utility>

#include "bench/Subject.hpp"
#include "bench/Timing.hpp"
#include "paths/PathText.hpp"

namespace bench {

using tessel::paths::PathList;

namespace {

void appendNumber(std::string& out, std::uint64_t value, std::size_t bytes) {
    for (std::size_t i = 0; i < bytes; ++i) {
        out.push_back(static_cast<char>(value >> (8 * i)));
    }
}

std::uint64_t readNumber(std::string_view& in, std::size_t bytes) {
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < bytes; ++i) {
        value |= std::uint64_t{static_cast<unsigned char>(in[i])} << (8 * i);
    }
    in.remove_prefix(bytes);
    return value;
}

// A container that keeps paths as they are. It has
//   Text, which takes what text(i) returns; static name; reserve for this many
//   paths of this many bytes; add; size; write to bytes and read from them.
template <class Container>
class Plain : public Subject {
public:
    explicit Plain(const PathList& paths) : list_(&paths) {}

    std::string name() const override { return Container::name(); }
    std::size_t paths() const override { return list_->size(); }

    double build() override {
        return secondsOf([&] {
            kept_ = std::make_unique<Container>();
            kept_->reserve(list_->size(), list_->textBytes());
            for (std::size_t i = 0; i < list_->size(); ++i) {
                kept_->add((*list_)[i]);
            }
        });
    }

    double iterate() override {
        typename Container::Text text;
        return secondsOf([&] {
            for (std::size_t i = 0; i < kept_->size(); ++i) read(i, text);
        });
    }
    double fetchAll() override { return iterate(); }
    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        typename Container::Text text;
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                read(number - 1, text);
            }
        });
    }

    double store() override {
        std::string().swap(form_);
        return secondsOf([&] { kept_->write(form_); });
    }
    double restore() override {
        return secondsOf([&] {
            restored_ = std::make_unique<Container>();
            restored_->reserve(list_->size(), list_->textBytes());
            restored_->read(form_);
        });
    }
    double destroyRestored() override {
        return secondsOf([&] { restored_.reset(); });
    }
    double destroy() override {
        return secondsOf([&] { kept_.reset(); });
    }

    std::size_t storedBytes() const override { return form_.size(); }
    bool verify() override { return isList(*kept_); }
    bool verifyRestored() override { return isList(*restored_); }

private:
    void read(std::size_t i, typename Container::Text& text) const {
        text.assign(kept_->text(i));
        keep(text);
    }

    bool isList(const Container& tested) const {
        std::string path;
        if (tested.size() != list_->size()) return false;
        for (std::size_t i = 0; i < list_->size(); ++i) {
            path.clear();
            if (!Container::toPath(tested.text(i), path) ||
                path != (*list_)[i]) {
                return false;
            }
        }
        return true;
    }

    const PathList* list_;
    std::unique_ptr<Container> kept_;
    std::unique_ptr<Container> restored_;
    std::string form_;
};

class TextVector {
public:
    using Text = std::u16string;
    static const char* name() { return "vector of u16string"; }

    void reserve(std::size_t paths, std::size_t /*bytes*/) {
        texts_.reserve(paths);
    }
    void add(std::string_view path) {
        texts_.push_back(tessel::paths::toText(path));
    }
    std::size_t size() const { return texts_.size(); }
    const Text& text(std::size_t i) const { return texts_[i]; }
    static bool toPath(const Text& text, std::string& path) {
        return tessel::paths::appendBytes(text, path);
    }

    // Each text's length in 4 bytes and its units.
    void write(std::string& out) const {
        for (const Text& text : texts_) {
            appendNumber(out, text.size(), 4);
            const std::size_t before = out.size();
            const std::size_t bytes = text.size() * sizeof(char16_t);
            out.resize(before + bytes);
            std::memcpy(out.data() + before, text.data(), bytes);
        }
    }
    void read(std::string_view in) {
        while (!in.empty()) {
            Text& text = texts_.emplace_back(readNumber(in, 4), u'\0');
            const std::size_t bytes = text.size() * sizeof(char16_t);
            std::memcpy(text.data(), in.data(), bytes);
            in.remove_prefix(bytes);
        }
    }

private:
    std::vector<Text> texts_;
};

class StringVector {
public:
    using Text = std::string;
    static const char* name() { return "vector of string"; }

    void reserve(std::size_t paths, std::size_t /*bytes*/) {
        texts_.reserve(paths);
    }
    void add(std::string_view path) { texts_.emplace_back(path); }
    std::size_t size() const { return texts_.size(); }
    const Text& text(std::size_t i) const { return texts_[i]; }
    static bool toPath(const Text& text, std::string& path) {
        path = text;
        return true;
    }

    // Each text and a NUL.
    void write(std::string& out) const {
        for (const Text& text : texts_) out.append(text).push_back('\0');
    }
    void read(std::string_view in) {
        while (!in.empty()) {
            texts_.emplace_back(in.substr(0, in.find('\0')));
            in.remove_prefix(texts_.back().size() + 1);
        }
    }

private:
    std::vector<Text> texts_;
};

// All texts one after the other, and where each ends.
template <class Offset>
class TextBuffer {
public:
    using Text = std::string;
    static const char* name() {
        return sizeof(Offset) == 4 ? "text and 32-bit offsets"
                                   : "text and 64-bit offsets";
    }

    void reserve(std::size_t paths, std::size_t bytes) {
        ends_.reserve(paths);
        buffer_.reserve(bytes);
    }
    void add(std::string_view path) {
        buffer_.append(path);
        ends_.push_back(static_cast<Offset>(buffer_.size()));
    }
    std::size_t size() const { return ends_.size(); }
    std::string_view text(std::size_t i) const {
        const std::size_t start = i == 0 ? 0 : ends_[i - 1];
        return std::string_view(buffer_).substr(start, ends_[i] - start);
    }
    static bool toPath(std::string_view text, std::string& path) {
        path = text;
        return true;
    }

    // Both lengths in 8 bytes, and both as they are.
    void write(std::string& out) const {
        appendNumber(out, buffer_.size(), 8);
        appendNumber(out, ends_.size(), 8);
        out.append(buffer_);
        const std::size_t before = out.size();
        out.resize(before + ends_.size() * sizeof(Offset));
        std::memcpy(out.data() + before, ends_.data(), out.size() - before);
    }
    void read(std::string_view in) {
        const std::uint64_t bytes = readNumber(in, 8);
        ends_.resize(readNumber(in, 8));
        buffer_.assign(in.substr(0, bytes));
        std::memcpy(ends_.data(), in.data() + bytes,
                    ends_.size() * sizeof(Offset));
    }

private:
    std::string buffer_;
    std::vector<Offset> ends_;
};

}  // namespace

SubjectPtr makeTextVector(const PathList& list) {
    return std::make_unique<Plain<TextVector>>(list);
}

SubjectPtr makeStringVector(const PathList& list) {
    return std::make_unique<Plain<StringVector>>(list);
}

SubjectPtr makeTextBuffer(const PathList& list) {
    if (list.textBytes() > std::numeric_limits<std::uint32_t>::max()) {
        return std::make_unique<Plain<TextBuffer<std::uint64_t>>>(list);
    }
    return std::make_unique<Plain<TextBuffer<std::uint32_t>>>(list);
}

}  // namespace bench
