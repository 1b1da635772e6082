#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <csignal>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <utility>

#include "archive/LostPages.hpp"

namespace tessel::archive {
namespace {

std::size_t pageBytes() {
    return static_cast<std::size_t>(::sysconf(_SC_PAGESIZE));
}

// A mapped file without a name, as long as three pages, full of ones.
class MappedPages {
public:
    MappedPages() {
        std::string name = testing::TempDir() + "pages-XXXXXX";
        file_ = ::mkostemp(name.data(), O_CLOEXEC);
        ::unlink(name.c_str());
        const std::string ones(bytes(), 1);
        EXPECT_EQ(::pwrite(file_, ones.data(), ones.size(), 0),
                  static_cast<ssize_t>(ones.size()));
        start_ = static_cast<const volatile std::uint8_t*>(
            ::mmap(nullptr, bytes(), PROT_READ, MAP_SHARED, file_, 0));
    }
    ~MappedPages() {
        ::munmap(data(), bytes());
        ::close(file_);
    }
    MappedPages(const MappedPages&) = delete;
    MappedPages& operator=(const MappedPages&) = delete;

    void cut(std::size_t pages) const {
        EXPECT_EQ(::ftruncate(file_, static_cast<off_t>(pages * pageBytes())),
                  0);
    }
    static std::size_t bytes() { return 3 * pageBytes(); }
    void* data() const {
        return const_cast<std::uint8_t*>(
            static_cast<const volatile std::uint8_t*>(start_));
    }
    int at(std::size_t page) const { return start_[page * pageBytes()]; }
    LostPages watched() const { return {data(), bytes()}; }

private:
    int file_ = -1;
    const volatile std::uint8_t* start_ = nullptr;
};

TEST(LostPages, BecomeZerosAndAreRemembered) {
    const MappedPages pages;
    const LostPages lost = pages.watched();
    EXPECT_EQ(pages.at(2), 1);
    EXPECT_FALSE(lost.any());
    pages.cut(2);
    EXPECT_EQ(pages.at(2), 0);
    EXPECT_TRUE(lost.any());
    EXPECT_EQ(pages.at(1), 1);
    pages.cut(3);
    EXPECT_EQ(pages.at(2), 0) << "a page of zeros stays";
    EXPECT_TRUE(lost.any());
}

TEST(LostPages, EachRangeHasItsOwnMark) {
    const MappedPages pages;
    const MappedPages others;
    const LostPages none;
    LostPages first = pages.watched();
    const LostPages second = others.watched();
    pages.cut(0);
    EXPECT_EQ(pages.at(0), 0);
    EXPECT_TRUE(first.any());
    EXPECT_FALSE(second.any());
    EXPECT_FALSE(none.any());
    const LostPages moved = std::move(first);
    EXPECT_TRUE(moved.any());
}

TEST(LostPages, AUsedRangeStartsAnew) {
    const MappedPages pages;
    {
        const LostPages lost = pages.watched();
        pages.cut(0);
        EXPECT_EQ(pages.at(0), 0);
        EXPECT_TRUE(lost.any());
    }
    const MappedPages others;
    const LostPages lost = others.watched();
    EXPECT_FALSE(lost.any());
    others.cut(1);
    EXPECT_EQ(others.at(1), 0);
    EXPECT_TRUE(lost.any());
}

// ---- What is none of its business; each in a process of its own ----

class LostPagesDeathTest : public testing::Test {
protected:
    LostPagesDeathTest() { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

// Sanitizers set a handler of their own.
void handleAsUsual() {
    if (std::signal(SIGBUS, SIG_DFL) == SIG_ERR) std::_Exit(1);
}

void touchLostPage() {
    const MappedPages pages;
    pages.cut(0);
    std::_Exit(pages.at(0));
}

TEST_F(LostPagesDeathTest, OthersFaultsEndTheProcess) {
    EXPECT_EXIT(
        {
            handleAsUsual();
            const MappedPages pages;
            const LostPages lost = pages.watched();
            touchLostPage();
        },
        testing::KilledBySignal(SIGBUS), "");
}

TEST_F(LostPagesDeathTest, ARangeIsNoLongerWatchedAfterItsEnd) {
    EXPECT_EXIT(
        {
            handleAsUsual();
            const MappedPages pages;
            { const LostPages lost = pages.watched(); }
            pages.cut(0);
            std::_Exit(pages.at(0));
        },
        testing::KilledBySignal(SIGBUS), "");
}

TEST_F(LostPagesDeathTest, OthersFaultsGoToTheHandlerOfBefore) {
    for (const bool takesInformation : {false, true})
        EXPECT_EXIT(
            {
                struct sigaction action {};
                if (takesInformation) {
                    action.sa_flags = SA_SIGINFO;
                    action.sa_sigaction = [](int, siginfo_t* about, void*) {
                        std::_Exit(about->si_code == BUS_ADRERR ? 7 : 8);
                    };
                } else {
                    action.sa_handler = [](int) { std::_Exit(7); };
                }
                ::sigaction(SIGBUS, &action, nullptr);
                const MappedPages pages;
                const LostPages lost = pages.watched();
                touchLostPage();
            },
            testing::ExitedWithCode(7), "");
}

TEST_F(LostPagesDeathTest, ASentSignalMeansWhatItMeantBefore) {
    const auto send = [](void (*handler)(int)) {
        if (std::signal(SIGBUS, handler) == SIG_ERR) std::_Exit(1);
        const MappedPages pages;
        const LostPages lost = pages.watched();
        std::raise(SIGBUS);
        std::_Exit(lost.any() ? 1 : 0);
    };
    EXPECT_EXIT(send(SIG_DFL), testing::KilledBySignal(SIGBUS), "");
    EXPECT_EXIT(send(SIG_IGN), testing::ExitedWithCode(0), "");
    EXPECT_EXIT(send([](int) {}), testing::ExitedWithCode(0), "");
}

}  // namespace
}  // namespace tessel::archive
