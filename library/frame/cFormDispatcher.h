// The library's entry object.
#pragma once

#include "library/contracts/IZonFormDispatcher.h"
#include "library/contracts/IZonTerminate.h"
#include "library/frame/LibObject.h"

namespace PeltaNom15 {

class cFormDispatcher final : public IZonFormDispatcher, public IZonTerminate, public LibObject {
public:
    cFormDispatcher();
    ~cFormDispatcher() override;

    // IZonFormDispatcher
    std::string LibName() override;
    pelta::ObjectRef GetForm(std::string& Name) override;
    int32_t UnloadAllForms() override;

    // IZonTerminate
    void QueryTerminate(bool& Cancel) override;
    void Terminate() override;

    pelta::Variant invoke(std::string_view member, pelta::CallKind kind,
                          std::span<pelta::Variant> args) override;
    std::string typeName() const override { return "cFormDispatcher"; }

private:
    std::string m_sLibName;
};

}  // namespace PeltaNom15
