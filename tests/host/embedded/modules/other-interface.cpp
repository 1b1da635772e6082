// A module for another kind of host.
extern "C" void notOfferedByAnyHost();
extern "C" void VXInitialize_libother_interface() { notOfferedByAnyHost(); }
