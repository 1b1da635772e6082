#include "binding/Errors.hpp"

#include <utility>

#include "binding/HostAccess.hpp"

namespace tessel {

namespace {

// MessageIdException is what travels to the host: a copy of the error, which
// outlives whatever the raising frame held.
class MessageIdException {
public:
    explicit MessageIdException(const MessageIdError& source)
        : error_(source.clone()) {}

    void report() const {
        host().HostError(error_->identifier(), error_->argumentList());
    }
    void rethrow() const { error_->rethrow(); }

private:
    std::unique_ptr<MessageIdError> error_;
};

}  // namespace

MessageIdError::MessageIdError(
    std::vector<HostMessageArgument> messageArguments,
    std::string messageComponent, std::string messageKey)
    : arguments_(std::move(messageArguments)),
      component_(std::move(messageComponent)),
      key_(std::move(messageKey)),
      fullIdentifier_(component_ + ":" + key_) {}

void raiseHostError(const MessageIdError& error) {
    const MessageIdException wrapped(error);
    wrapped.report();
    wrapped.rethrow();
    throw HostReturnedException();  // for the compiler: rethrow has thrown
}

void checkElement(std::size_t count, bool inFolders, std::size_t outer,
                  std::size_t inner) {
    namespace errors = VELOX::datastoreio::huffmanpaths;
    if (count != 0) return;
    std::string position = std::to_string(outer);
    if (inner != 0) position += ", " + std::to_string(inner);
    if (inFolders) raiseHostError(errors::folderElementEmpty(position));
    raiseHostError(errors::fileElementEmpty(position));
}

}  // namespace tessel
