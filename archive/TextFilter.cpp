#include "archive/TextFilter.hpp"

namespace tessel::archive {

TextFilter::TextFilter(std::span<const std::string_view> texts) {
    searches_.reserve(texts.size());
    for (const std::string_view text : texts)
        if (!text.empty()) searches_.emplace_back(text);
    missing_.reserve(searches_.size());
}

void TextFilter::enterFolder(std::string_view folder) {
    missing_.clear();
    for (std::size_t i = 0; i < searches_.size(); ++i) {
        if (searches_[i].isIn(folder)) continue;
        const std::size_t reach = searches_[i].text().size() - 1;
        missing_.push_back({i, folder.size() - std::min(folder.size(), reach)});
    }
}

}  // namespace tessel::archive
