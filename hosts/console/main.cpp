#include <unistd.h>

#include <exception>
#include <iostream>
#include <new>
#include <string>
#include <vector>

#include "hosts/console/Console.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/ExitStatus.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/StandardStreams.hpp"

int main(int wordCount, char** words) {
    namespace console = tessel::console;
    try {
        console::takeStandardDescriptors();
        console::Interrupts interrupts;
        console::OutputBuffer output(STDOUT_FILENO, "standard output");
        console::OutputBuffer errors(STDERR_FILENO, "standard error");
        console::Session session{interrupts, output, errors};
        try {
            return console::runConsole(
                std::vector<std::string>(words + 1, words + wordCount),
                session);
        } catch (const console::ClosedPipeException&) {
            interrupts.endByClosedPipe();
        }
    } catch (const std::bad_alloc&) {
        // Here, too, where there is no memory to describe another failure.
        std::cerr << "tessel: " << console::outOfMemoryLine << '\n';
        return static_cast<int>(console::ExitStatus::System);
    } catch (const std::exception& failure) {
        // The command did not start.
        std::cerr << "tessel: " << failure.what() << '\n';
        return static_cast<int>(console::ExitStatus::System);
    }
}
