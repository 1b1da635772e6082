#include "hosts/console/ReportPicture.hpp"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <string_view>

#include "hosts/console/Quantities.hpp"
#include "hosts/console/SvgText.hpp"

namespace tessel::console {

namespace {

constexpr double pictureWidth = 840;
constexpr double margin = 24;
constexpr double titleHeight = 74;
constexpr double rowHeight = 24;
constexpr double chartHeight = 220;
constexpr std::size_t maxBins = 64;

// Okabe and Ito's palette, which colour-blind people tell apart.
constexpr std::array<std::string_view, 8> colours = {
    "#0072b2", "#e69f00", "#009e73", "#cc79a7",
    "#56b4e9", "#d55e00", "#f0e442", "#888888"};
constexpr std::string_view axisColour = "#888";
constexpr std::string_view gridColour = "#ddd";

double shareOf(std::uint64_t part, std::uint64_t all) noexcept {
    return all == 0 ? 0 : static_cast<double>(part) / static_cast<double>(all);
}

// The smallest of 1, 2, 5, 10, 20, ... that is at least `value`.
double roundUp(double value) noexcept {
    const double power = std::pow(10, std::floor(std::log10(value)));
    for (const double factor : {1.0, 2.0, 5.0})
        if (factor * power >= value) return factor * power;
    return 10 * power;
}

void drawTitle(const ArchiveReport& report, SvgText& svg) {
    const ArchiveInfo& info = report.info;
    svg.text(margin, 32, 18, TextAnchor::Start, report.file);
    svg.text(margin, 54, 13, TextAnchor::Start,
             fmt::format("{} paths, {} of text in {}: {:.2f} bytes per path",
                         groupedText(info.paths),
                         bytesText(static_cast<double>(report.textBytes)),
                         bytesText(static_cast<double>(info.fileBytes)),
                         report.perPath(info.fileBytes)));
}

// One bar per section. Returns the height that they take.
double drawSections(const ArchiveReport& report, double top, SvgText& svg) {
    constexpr double barStart = 200;
    constexpr double barWidth = 430;
    const auto& sections = report.info.sections;
    svg.text(margin, top, 14, TextAnchor::Start, "Bytes of the file");
    std::uint64_t most = 1;
    for (const auto& section : sections) most = std::max(most, section.bytes);
    double y = top + 14;
    for (std::size_t i = 0; i < sections.size(); ++i, y += rowHeight) {
        const auto& section = sections[i];
        const std::string figures =
            fmt::format("{} B  {:.1f} %", groupedText(section.bytes),
                        100 * shareOf(section.bytes, report.info.fileBytes));
        svg.text(barStart - 10, y + 16, 12, TextAnchor::End, section.name);
        svg.box(barStart, y + 4, barWidth * shareOf(section.bytes, most), 16,
                colours.at(i % colours.size()), section.name + ": " + figures);
        svg.text(pictureWidth - margin, y + 16, 12, TextAnchor::End, figures);
    }
    return y - top;
}

void drawShareAxis(double top, double highest, SvgText& svg) {
    constexpr int steps = 4;
    for (int i = 0; i <= steps; ++i) {
        const double share = highest * i / steps;
        const double y =
            top + chartHeight * (1 - static_cast<double>(i) / steps);
        svg.line(margin + 46, y, pictureWidth - margin, y,
                 i == 0 ? axisColour : gridColour);
        svg.text(margin + 40, y + 4, 11, TextAnchor::End,
                 fmt::format("{:.3g} %", share));
    }
}

void drawLengths(const ArchiveReport& report, double top, SvgText& svg) {
    svg.text(margin, top, 14, TextAnchor::Start,
             "Lengths of paths in bytes, share of all paths");
    const auto bins = report.lengths.bins(maxBins);
    if (bins.empty()) return;
    std::uint64_t most = 1;
    for (const auto& bin : bins) most = std::max(most, bin.paths);
    const double highest = roundUp(100 * shareOf(most, report.info.paths));
    const double chartTop = top + 18;
    drawShareAxis(chartTop, highest, svg);
    const double left = margin + 50;
    const double width =
        (pictureWidth - margin - left) / static_cast<double>(bins.size());
    const std::size_t labelEach = std::max<std::size_t>(1, bins.size() / 8);
    for (std::size_t i = 0; i < bins.size(); ++i) {
        const double share = 100 * shareOf(bins[i].paths, report.info.paths);
        const double height = chartHeight * share / highest;
        const double x = left + width * static_cast<double>(i);
        svg.box(x, chartTop + chartHeight - height, width * 0.88, height,
                colours[0],
                fmt::format("{} to {} bytes: {} paths", bins[i].begin,
                            bins[i].end - 1, groupedText(bins[i].paths)));
        if (i % labelEach == 0)
            svg.text(x, chartTop + chartHeight + 16, 11, TextAnchor::Start,
                     std::to_string(bins[i].begin));
    }
}

}  // namespace

std::string pictureOf(const ArchiveReport& report) {
    const double sectionsHeight =
        14 + rowHeight * static_cast<double>(report.info.sections.size());
    const double height =
        titleHeight + sectionsHeight + 40 + chartHeight + 18 + 40;
    SvgText svg(pictureWidth, height);
    drawTitle(report, svg);
    const double used = drawSections(report, titleHeight + 12, svg);
    drawLengths(report, titleHeight + 12 + used + 34, svg);
    return svg.finished();
}

}  // namespace tessel::console
