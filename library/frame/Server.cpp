// The library as an in-process server: its public classes with their fixed
// class identifiers, and the four exported entry points.
#include "library/frame/LibObject.h"
#include "library/frame/cFormDispatcher.h"
#include "library/items/ctxItems.h"
#include "library/other/ctxRatios.h"
#include "library/partners/ctxContragents.h"
#include "platform/automation/registry.h"

namespace PeltaNom15 {
namespace {

const char kAnchor = 0;  // an address inside the library, to find its file

template <class T>
pelta::ObjectRef create() {
    return pelta::ObjectRef(pelta::makeRef<T>());
}

// Classes without a creator are registered but not yet available.
const pelta::InprocServer& server() {
    static const pelta::InprocServer s(
        "PeltaNom15",
        {
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0001}", "cFormDispatcher", &create<cFormDispatcher>},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0002}", "ctxItems", &create<ctxItems>},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0003}", "ctxFlat", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0004}", "ctxDocTypes", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0005}", "ctxAccAccounts", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0006}", "ctxContragents", &create<ctxContragents>},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0007}", "ctxRatios", &create<ctxRatios>},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0008}", "ctxPriceLists", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0009}", "ctxDimensions", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000A}", "ctxDiscounts", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000B}", "ctxLocks", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000C}", "ctxItemsReserved", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000D}", "ctxCostCenters", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000E}", "ctxBonuses", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000F}", "ctxRoutes", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0010}", "ctxFinStruct", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0011}", "ctxMedia", nullptr},
            {"{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0012}", "ctxMachines", nullptr},
        },
        &kAnchor);
    return s;
}

}  // namespace
}  // namespace PeltaNom15

extern "C" {

__attribute__((visibility("default"))) pelta::HResult DllRegisterServer() {
    return PeltaNom15::server().registerServer();
}

__attribute__((visibility("default"))) pelta::HResult DllUnregisterServer() {
    return PeltaNom15::server().unregisterServer();
}

__attribute__((visibility("default"))) pelta::HResult DllGetClassObject(
    const pelta::Guid* clsid, pelta::ClassFactory** factory) {
    return PeltaNom15::server().getClassObject(clsid, factory);
}

__attribute__((visibility("default"))) pelta::HResult DllCanUnloadNow() {
    return PeltaNom15::server().canUnloadNow(PeltaNom15::LibObject::liveObjects());
}
}
