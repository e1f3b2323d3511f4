/// \file
/// Identifiers of remotely callable objects.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmID.h>

/// Names an object that the other side of a client/server connection can call. 0 is empty; 1 to
/// `RS_LAST_SINGLETON_ID` (20) are reserved for well-known objects, of which 1 to `RS_MAX` (9) are
/// server-side singletons with fixed class names. 8 is left unused on purpose and has no name.
///
/// A plain value (but see `next()`): copy it freely between threads. Nothing fails.
class ZMLIB_API ZmRemotificationID : public ZmID<int, 0> {
public:
    constexpr ZmRemotificationID() noexcept = default;

    static const ZmRemotificationID RS_SERVER_PEER;       ///< 1, "KvServerPeer"
    static const ZmRemotificationID RS_BACKEND_PEER;      ///< 2, "KvBackendPeer"
    static const ZmRemotificationID RS_TRANSFER_MANAGER;  ///< 3, "KvTransferManager"
    static const ZmRemotificationID RS_LOAD_MANAGER;      ///< 4, "ExLoadManager"
    static const ZmRemotificationID RS_DATA_MANAGER;      ///< 5, "ExDataManager"
    static const ZmRemotificationID RS_VOLUME_INFO_CACHE; ///< 6, "KvVolumeInfoCache"
    static const ZmRemotificationID RS_ERROR_NOTIFIER;    ///< 7, "KvErrorNotifier"
    /// 9, "KvPowerScribeCtrl": the control object of the dictation system.
    static const ZmRemotificationID RS_POWERSCRIBE_CTRL;
    static const ZmRemotificationID RS_MAX;               ///< 9, the last reserved singleton
    static const ZmRemotificationID RS_LAST_SINGLETON_ID; ///< 20, the last reserved identifier

    /// 1 <= value <= 20.
    bool isReserved() const noexcept { return value() >= 1 && value() <= kLastReserved; }
    /// 1 <= value <= 9.
    bool isReservedSingleton() const noexcept { return value() >= 1 && value() <= kMaxSingleton; }

    /// Counts this identifier up (or down) by one and returns a copy of the new value. Const and
    /// still changing the object is intended: callers keep a const identifier as their counter.
    ZmRemotificationID next(bool up) const noexcept
    {
        // Wraps at the ends of int instead of overflowing.
        m_value = static_cast<int>(static_cast<unsigned int>(m_value) + (up ? 1u : ~0u));
        return *this;
    }

    /// The class name of a reserved singleton (null for 0 and 8). The value indexes a table of
    /// ten entries without a bounds check, as intended: ask only for reserved singletons.
    const char* singletonClassName() const noexcept;

private:
    constexpr explicit ZmRemotificationID(int v) noexcept : ZmID<int, 0>(v) {}

    // Kept apart from the public constants, which next() could change.
    static constexpr int kMaxSingleton = 9;
    static constexpr int kLastReserved = 20;
};
