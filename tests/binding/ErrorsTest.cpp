#include <gtest/gtest.h>

#include "binding/Errors.hpp"
#include "tests/host/UncheckedHost.hpp"

// The binding's error values and the one step that raises them.
namespace {

namespace errors = VELOX::datastoreio::huffmanpaths;
using tessel::HostMessageArgument;
using tessel::binding::Element;
using tessel::binding::MessageIdError;

using Arguments = std::vector<HostMessageArgument>;

const std::string component = "VELOX:datastoreio:huffmanpaths:";

}  // namespace

TEST(BindingErrors, IdentifierIsComponentColonKey) {
    EXPECT_EQ(errors::fileListNotEven().identifier(),
              component + "fileListNotEven");
    EXPECT_EQ(errors::unequalNumFolderFileList().identifier(),
              component + "unequalNumFolderFileList");
    EXPECT_EQ(errors::folderElementEmpty("1").identifier(),
              component + "folderElementEmpty");
    EXPECT_EQ(errors::fileElementEmpty("1").identifier(),
              component + "fileElementEmpty");
}

TEST(BindingErrors, ArgumentsAreNoneOrThePositionText) {
    EXPECT_TRUE(errors::fileListNotEven().argumentList().empty());
    EXPECT_TRUE(errors::unequalNumFolderFileList().argumentList().empty());
    EXPECT_EQ(errors::folderElementEmpty("12, 3").argumentList(),
              (Arguments{std::string("12, 3")}));
    EXPECT_EQ(errors::fileElementEmpty("7").argumentList(),
              (Arguments{std::string("7")}));
}

TEST(BindingErrors, CopyIsOfTheSameTypeAndContent) {
    const errors::fileElementEmpty error("2, 4");
    const std::unique_ptr<MessageIdError> copy = error.clone();
    EXPECT_NE(dynamic_cast<errors::fileElementEmpty*>(copy.get()), nullptr);
    EXPECT_EQ(copy->identifier(), error.identifier());
    EXPECT_EQ(copy->argumentList(), error.argumentList());
    EXPECT_STREQ(copy->what(), error.what());
}

TEST(BindingErrors, RethrowIsOfTheErrorsOwnType) {
    EXPECT_THROW(errors::fileListNotEven().clone()->rethrow(),
                 errors::fileListNotEven);
    EXPECT_THROW(errors::unequalNumFolderFileList().clone()->rethrow(),
                 errors::unequalNumFolderFileList);
    EXPECT_THROW(errors::folderElementEmpty("1").clone()->rethrow(),
                 errors::folderElementEmpty);
    EXPECT_THROW(errors::fileElementEmpty("1").clone()->rethrow(),
                 errors::fileElementEmpty);
}

TEST(BindingErrors, RaisingHandsIdentifierAndArgumentsToTheHost) {
    unchecked::Host host;
    EXPECT_THROW(
        tessel::binding::raiseHostError(errors::folderElementEmpty("3")),
        unchecked::Raised);
    EXPECT_EQ(host.errors,
              (std::vector<std::string>{component + "folderElementEmpty(3)"}));
}

TEST(BindingErrors, RaisingThrowsTheErrorItselfIfTheHostReturns) {
    unchecked::Host host;
    host.errorEntryReturns = true;
    EXPECT_THROW(
        tessel::binding::raiseHostError(errors::folderElementEmpty("3")),
        errors::folderElementEmpty);
    EXPECT_THROW(tessel::binding::raiseHostError(errors::fileListNotEven()),
                 errors::fileListNotEven);
    EXPECT_EQ(host.errors.size(), 2U);
}

TEST(BindingErrors, ElementCheckPassesWhatHasElements) {
    const unchecked::Host host;
    tessel::binding::checkNotEmpty(1, Element::Folder, {1});
    tessel::binding::checkNotEmpty(5, Element::File, {9, 9});
    EXPECT_TRUE(host.errors.empty());
}

TEST(BindingErrors, ElementCheckBuildsPositionAndChoosesError) {
    unchecked::Host host;
    EXPECT_THROW(tessel::binding::checkNotEmpty(0, Element::Folder, {1}),
                 unchecked::Raised);
    EXPECT_THROW(tessel::binding::checkNotEmpty(0, Element::File, {12, 3}),
                 unchecked::Raised);
    EXPECT_THROW(tessel::binding::checkNotEmpty(0, Element::Folder, {2, 4}),
                 unchecked::Raised);
    EXPECT_THROW(tessel::binding::checkNotEmpty(0, Element::File, {1234567}),
                 unchecked::Raised);
    EXPECT_EQ(host.errors, (std::vector<std::string>{
                               component + "folderElementEmpty(1)",
                               component + "fileElementEmpty(12, 3)",
                               component + "folderElementEmpty(2, 4)",
                               component + "fileElementEmpty(1234567)"}));
}
