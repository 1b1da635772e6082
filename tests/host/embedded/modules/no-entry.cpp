// A module that forgot its entry.
extern "C" void VXTerminate_libno_entry() {}
