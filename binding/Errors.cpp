#include "binding/Errors.hpp"

#include <utility>

#include "binding/HostAccess.hpp"

namespace tessel::binding {

namespace {

// MessageIdException is what travels to the host: a copy of the error, which
// outlives whatever the raising frame held.
class MessageIdException {
public:
    explicit MessageIdException(const MessageIdError& error)
        : error_(error.clone()) {}

    void report() const {
        host().HostError(error_->identifier(), error_->argumentList());
    }
    void rethrow() const { error_->rethrow(); }

private:
    std::unique_ptr<MessageIdError> error_;
};

}  // namespace

MessageIdError::MessageIdError(std::vector<HostMessageArgument> arguments,
                               std::string component, std::string key)
    : arguments_(std::move(arguments)),
      component_(std::move(component)),
      key_(std::move(key)),
      fullIdentifier_(component_ + ":" + key_) {}

void raiseHostError(const MessageIdError& error) {
    const MessageIdException wrapped(error);
    wrapped.report();
    wrapped.rethrow();
    throw HostReturnedException();  // for the compiler: rethrow has thrown
}

void checkNotEmpty(std::size_t count, Element element,
                   ElementPosition position) {
    namespace errors = VELOX::datastoreio::huffmanpaths;
    if (count != 0) return;
    std::string text = std::to_string(position.outer);
    if (position.inner != 0) text += ", " + std::to_string(position.inner);
    if (element == Element::Folder)
        raiseHostError(errors::folderElementEmpty(text));
    raiseHostError(errors::fileElementEmpty(text));
}

}  // namespace tessel::binding
