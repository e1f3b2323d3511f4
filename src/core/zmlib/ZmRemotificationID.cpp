#include <zmlib/ZmRemotificationID.h>

namespace {

// Entry 8 stays null: that number is left unused on purpose.
const char* const kSingletonClassNames[10] = {
    nullptr,         "KvServerPeer",     "KvBackendPeer",     "KvTransferManager",
    "ExLoadManager", "ExDataManager",    "KvVolumeInfoCache", "KvErrorNotifier",
    nullptr,         "KvPowerScribeCtrl"};

} // namespace

// Constant-initialised (constexpr constructor): no code runs at start-up.
const ZmRemotificationID ZmRemotificationID::RS_SERVER_PEER(1);
const ZmRemotificationID ZmRemotificationID::RS_BACKEND_PEER(2);
const ZmRemotificationID ZmRemotificationID::RS_TRANSFER_MANAGER(3);
const ZmRemotificationID ZmRemotificationID::RS_LOAD_MANAGER(4);
const ZmRemotificationID ZmRemotificationID::RS_DATA_MANAGER(5);
const ZmRemotificationID ZmRemotificationID::RS_VOLUME_INFO_CACHE(6);
const ZmRemotificationID ZmRemotificationID::RS_ERROR_NOTIFIER(7);
const ZmRemotificationID ZmRemotificationID::RS_POWERSCRIBE_CTRL(9);
const ZmRemotificationID ZmRemotificationID::RS_MAX(9);
const ZmRemotificationID ZmRemotificationID::RS_LAST_SINGLETON_ID(20);

const char* ZmRemotificationID::singletonClassName() const noexcept
{
    // No bounds check, as intended: only reserved singletons have a meaningful entry.
    return kSingletonClassNames[value()];
}
