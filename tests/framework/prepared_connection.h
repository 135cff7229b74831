// A business-logic connection for framework tests: it serves prepared answers
// per operation and records every call. Requests and answers cross it as
// property-bag bytes, exactly as they cross the real service.
#pragma once

#include <functional>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

#include "library/contracts/Bll.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace fwtest {

using BagRef = pelta::Ref<pelta::PropertyBag>;

// What the connection hands back as the transport context.
class TransportContext : public virtual pelta::Object {};

class PreparedConnection : public PeltaNom15::IBllConnection {
public:
    using Handler = std::function<BagRef(const pelta::PropertyBag& request)>;

    struct CallRecord {
        int32_t kind = 0;
        std::string operation;
        size_t requestSize = 0;
        BagRef request;  // decoded from the bytes that crossed
    };

    void serve(const std::string& operation, Handler handler) {
        handlers_[operation] = std::move(handler);
        failing_.erase(operation);
    }
    // The same prepared answer every time.
    void serve(const std::string& operation, BagRef answer) {
        serve(operation, [answer](const pelta::PropertyBag&) { return answer; });
    }
    // The operation answers with the success flag False.
    void fail(const std::string& operation) { failing_[operation] = true; }

    void Call(int32_t CallKind, const std::string& Operation, const pelta::Bytes& Request,
              pelta::Bytes& Response, int32_t Reserved, pelta::ObjectRef& Context,
              const std::string& Options, bool& Success) override {
        auto request = pelta::PropertyBag::fromContents(Request);
        calls.push_back(CallRecord{CallKind, Operation, Request.size(), request});
        Response.clear();
        Success = false;
        if (failing_.count(Operation)) return;
        auto it = handlers_.find(Operation);
        if (it == handlers_.end())
            throw std::logic_error("No answer is prepared for the operation " + Operation);
        Response = it->second(*request)->contents();
        Context = pelta::makeRef<TransportContext>();
        Success = true;
    }

    pelta::Ref<PeltaNom15::IAppParameters> AppParameters() override { return nullptr; }
    std::string CurrentUserID() override { return "{00000000-0000-0000-0000-0000000000AA}"; }
    std::string CurrentUserName() override { return "Тест"; }

    std::vector<CallRecord> callsOf(const std::string& operation) const {
        std::vector<CallRecord> out;
        for (const auto& c : calls)
            if (c.operation == operation) out.push_back(c);
        return out;
    }

    std::vector<CallRecord> calls;

private:
    std::map<std::string, Handler> handlers_;
    std::map<std::string, bool> failing_;
};

inline BagRef bag() {
    return pelta::makeRef<pelta::PropertyBag>();
}

inline BagRef rightsAnswer(int32_t rights) {
    auto b = bag();
    b->writeProperty("Rights", pelta::Variant(rights));
    return b;
}

inline BagRef refusal(int32_t code) {
    auto b = bag();
    b->writeProperty("BllError", pelta::Variant(code));
    b->writeProperty("BllTable", pelta::Variant("CurrRatios"));
    return b;
}

}  // namespace fwtest
