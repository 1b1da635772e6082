// Path trees under wrong callers: any public operation in any order, with
// handles and stacks of other trees, with public state that was edited, and
// with insertions during a pass. Each call answers or throws a documented
// exception.
//
// Input: calls, each a byte that names it and the bytes that it takes.
#include <array>
#include <cstdint>
#include <memory>
#include <vector>

#include "fuzz/CallInput.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/TreeInserter.hpp"

namespace tessel::fuzz {
namespace {

class TreeCalls {
public:
    explicit TreeCalls(Input input) : input_(input) {
        for (auto& tree : trees_) tree = std::make_unique<BPathTree>();
        handles_.emplace_back();  // to no node
    }

    void run() {
        for (std::size_t i = 0; i < maxCalls && !input_.empty(); ++i)
            answered([&] { call(); });
    }

private:
    using Call = void (TreeCalls::*)();

    void call() {
        static constexpr std::array calls{
            &TreeCalls::addPath,     &TreeCalls::addBatch,
            &TreeCalls::addMany,     &TreeCalls::keepHandle,
            &TreeCalls::search,      &TreeCalls::searchAndAdd,
            &TreeCalls::beginPass,   &TreeCalls::takeNext,
            &TreeCalls::visitNext,   &TreeCalls::useStack,
            &TreeCalls::lookUp,      &TreeCalls::store,
            &TreeCalls::restore,     &TreeCalls::copy,
            &TreeCalls::replaceRoot, &TreeCalls::editPass,
            &TreeCalls::insert};
        const Call chosen = calls[input_.byte() % calls.size()];
        (this->*chosen)();
    }

    BPathTree& tree() { return *trees_[input_.byte() % trees_.size()]; }
    BNodePtr& handle() { return handles_[input_.byte() % handles_.size()]; }
    BNodePtr& realHandle() {
        BNodePtr& chosen = handle();
        if (!chosen) chosen = tree().root;
        return chosen;
    }

    void addPath() {
        Components path = takeComponents(input_);
        tree().addPath(path, track_);
    }

    void addBatch() {
        Components folder = takeComponents(input_);
        Components files = takeComponents(input_);
        std::uint64_t first = 0;
        tree().addPath(folder, files, track_, first);
    }

    // So many files that the folder is searched by an index.
    void addMany() {
        Components folder = takeComponents(input_);
        Components files;
        for (unsigned left = input_.byte() % 64; left > 0; --left)
            files.push_back({static_cast<std::uint8_t>(left), 1});
        std::uint64_t first = 0;
        tree().addPath(folder, files, track_, first);
    }

    void keepHandle() {
        const BNodePtr from = realHandle();
        const ChildList children = from->children();
        const std::size_t count = children.size();
        if (count == 0)
            handles_.push_back(tree().root);
        else
            handles_.emplace_back(children[input_.byte() % count]);
    }

    void search() {
        const BNodePtr among = realHandle();
        tree().findNode(takeComponent(input_), among->children());
        tree().isLeaf(handle());
        const BNodePtr& one = handle();
        const BNodePtr& other = handle();
        require((one == other) == (other == one), "equality goes both ways");
    }

    void searchAndAdd() {
        const BNodePtr among = realHandle();
        Component value = takeComponent(input_);
        bool existed = false;
        tree().addIfExistsAndFind(among->children(), value, existed);
    }

    void beginPass() { tree().reset(); }

    void takeNext() {
        BPathTree& from = tree();
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            if (from.hasNextPath()) from.getNextPath(path_);
        from.getNextPath(path_);
    }

    // The visitor uses the tree that it is called from.
    void visitNext() {
        BPathTree& from = tree();
        from.visitNextPath([&](const PathView&) {
            switch (input_.byte() % 4) {
                case 0:
                    return from.getNextPath(path_);
                case 1:
                    return from.reset();
                case 2:
                    return addMany();
                default:
                    throw std::out_of_range("the visitor's own");
            }
        });
    }

    void useStack() {
        NodeStack& stack = this->stack();
        BPathTree& from = tree();
        switch (input_.byte() % 6) {
            case 0:
                return from.pushAllChildren(handle(), stack);
            case 1:
                return stack.push(handle());
            case 2:
                return stack.pop();
            case 3:
                if (from.isNodeAtEndOfParent(handle(), stack)) stack.clear();
                return;
            case 4:
                if (stack.top().isLeaf()) stack.reserve(3);
                return;
            default:
                if (!stack.topChild().value().empty()) stack.pop();
        }
    }

    NodeStack& stack() {
        switch (input_.byte() % 3) {
            case 0:
                return tree().pendingNodes;
            case 1:
                return tree().parentNodes;
            default:
                return stack_;
        }
    }

    void lookUp() {
        const BPathTree& in = tree();
        answered([&] { in.traversePath(track_, path_); });
        const std::vector<PathTrack> tracks{takeTrack(input_), track_};
        std::vector<Components> folders;
        std::vector<Components> files;
        in.getPath(folders, files, {wildNumber(input_), 0}, tracks,
                   {takeTrack(input_), takeTrack(input_)});
        track_.clear();
    }

    void store() {
        codes_.clear();
        values_.clear();
        tree().serialize(codes_, values_);
        tree().memoryUsage();
    }

    void restore() {
        if (!codes_.empty() && input_.byte() % 2 == 0)
            codes_[input_.byte() % codes_.size()] = input_.byte() % 5;
        tree().deserialize(codes_, values_);
    }

    void copy() {
        auto made = std::make_unique<BPathTree>(tree());
        trees_[input_.byte() % trees_.size()] = std::move(made);
    }

    void replaceRoot() { tree().root = handle(); }

    void editPass() {
        BPathTree& edited = tree();
        switch (input_.byte() % 4) {
            case 0:
                edited.pendingNodes = tree().pendingNodes;
                return;
            case 1:
                edited.parentNodes = tree().parentNodes;
                return;
            case 2:
                edited.currentPrefix = takeComponents(input_);
                return;
            default:
                edited.spareFlag = !edited.spareFlag;
                edited.pendingNodes.clear();
        }
    }

    void insert() {
        TreeInserter& inserter = tree().inserter();
        switch (input_.byte() % 3) {
            case 0:
                return inserter.releaseIndex(wildNumber(input_));
            case 1:
                return inserter.trim(*realHandle());
            default:
                return inserter.add(*realHandle(), takeComponent(input_));
        }
    }

    Input input_;
    std::array<std::unique_ptr<BPathTree>, 3> trees_;
    std::vector<BNodePtr> handles_;
    NodeStack stack_;
    PathTrack track_;
    Components path_;
    std::vector<std::uint8_t> codes_;
    Components values_;
};

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::TreeCalls({data, size}).run();
    return 0;
}
