/// \file
/// The interface owner made for an interface that is given none.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmHandable.h>
#include <zmlib/ZmInterfaceOwner.h>

/// A reference-counted `ZmInterfaceOwner`: deletes itself, with its managed interfaces, when its
/// count drops below 1. `ZmInterface` creates one when constructed without an owner.
class ZMLIB_API ZmInterfaceOwnerDefaultImpl : public ZmInterfaceOwner, public ZmHandable {
public:
    ZmInterfaceOwnerDefaultImpl();
    void ref() const override { ZmHandable::ref(); }
    void unref() const override { ZmHandable::unref(); }

protected:
    ~ZmInterfaceOwnerDefaultImpl() override;
    /// The owner's teardown (one override for both bases).
    void notifyDelete() override { ZmInterfaceOwner::notifyDelete(); }
};
