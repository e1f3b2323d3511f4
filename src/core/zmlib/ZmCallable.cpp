#include <zmlib/ZmCallable.h>

// Anchors the virtual table in the library.
ZmCallable::~ZmCallable() = default;
