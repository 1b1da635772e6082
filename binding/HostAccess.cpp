#include "binding/HostAccess.hpp"

#include <new>

namespace tessel::binding {

namespace {

std::string versionRefusal(std::uint32_t offered) {
    return "libqztessel needs version " + std::to_string(hostInterfaceVersion) +
           " of the host interface; this host offers version " +
           std::to_string(offered) + ".";
}

OwnedArray owned(HostArray* array) {
    if (array == nullptr) throw HostAllocationFailure();
    return OwnedArray(array);
}

}  // namespace

HostInterface& host() {
    const HostGate* const gate = VXHostInterface(hostInterfaceVersion);
    if (gate->version != hostInterfaceVersion)
        throw HostRefusedException(versionRefusal(gate->version));
    if (gate->host == nullptr)
        throw HostRefusedException("This process runs no host at present.");
    return *gate->host;
}

void ArrayReleaser::operator()(HostArray* array) const noexcept {
    host().hostReleaseArray(array);
}

OwnedArray createText(std::u16string_view text) {
    return owned(host().hostCreateCharArray(text));
}

OwnedArray createCell(std::size_t rows, std::size_t columns) {
    return owned(host().hostCreateCell(rows, columns));
}

OwnedArray createNumeric(std::size_t rows, HostNumericClass numericClass) {
    return owned(host().hostCreateNumeric(rows, 1, numericClass));
}

OwnedArray createLogical(bool value) {
    return owned(host().hostCreateLogicalScalar(value));
}

void raiseOutOfMemory() {
    host().hostErrorOutOfMemory();
    throw std::bad_alloc();
}

}  // namespace tessel::binding
