#include "hosts/embedded/FilesetClass.hpp"

#include <utility>

namespace tessel::embedded {

namespace {

Value copyFileset(Host& host, const Value& instance) {
    return host.construct(filesetClassName, Value::text(u"copy"), instance);
}

void saveStoredForm(Host& host, const Value& instance, Value& saved) {
    std::vector<Value> outputs = host.call(2, instance, "serialize");
    saved.setField("PathTree", std::move(outputs[1]));
}

}  // namespace

ClassExtension filesetExtension() { return {copyFileset, saveStoredForm}; }

}  // namespace tessel::embedded
