#pragma once

// In a program that links FailingAllocation.cpp, operator new can be told to
// fail, for the program and for every module that it loads.
namespace failing {

// While it lives, the n-th allocation from its making on fails, once, on
// whichever thread it comes.
class Allocation {
public:
    explicit Allocation(long n);
    Allocation(const Allocation&) = delete;
    Allocation& operator=(const Allocation&) = delete;
    ~Allocation();

    // Whether that allocation has come.
    bool hasFailed() const;
};

// Bytes asked for since the program began.
unsigned long bytesAsked();

// Blocks released since the program began.
unsigned long blocksReleased();

}  // namespace failing
