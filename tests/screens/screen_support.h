// What every screen test needs: a temporary demo database behind the real
// service, the headless framework with a scripted user agent, the library
// registered in a temporary class registry, and list controls created by
// programmatic identifier and initialised with a client site, as a host does.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <map>
#include <string>

#include "bll/database.h"
#include "bll/service.h"
#include "framework/form_extender.h"
#include "framework/framework.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "library/contracts/Public.h"
#include "library/frame/LibObject.h"
#include "library/frame/mdClassFactory.h"
#include "platform/automation/registry.h"
#include "platform/data/recordset.h"

namespace screentest {

namespace fs = std::filesystem;
using namespace PeltaNom15;

// Passes calls to the real service and counts them by operation, so that a
// test can tell that a screen did not call the service at all.
class CountingConnection final : public IBllConnection {
public:
    explicit CountingConnection(pelta::Ref<IBllConnection> inner) : inner_(std::move(inner)) {}
    void Call(int32_t CallKind, const std::string& Operation, const pelta::Bytes& Request,
              pelta::Bytes& Response, int32_t Reserved, pelta::ObjectRef& Context,
              const std::string& Options, bool& Success) override {
        ++calls[Operation];
        inner_->Call(CallKind, Operation, Request, Response, Reserved, Context, Options, Success);
    }
    pelta::Ref<IAppParameters> AppParameters() override { return inner_->AppParameters(); }
    std::string CurrentUserID() override { return inner_->CurrentUserID(); }
    std::string CurrentUserName() override { return inner_->CurrentUserName(); }

    std::map<std::string, int> calls;

private:
    pelta::Ref<IBllConnection> inner_;
};

class ScreenTest : public ::testing::Test {
protected:
    void SetUp() override {
        char tmpl[] = "/tmp/pelta_screens_XXXXXX";
        dir_ = ::mkdtemp(tmpl);
        ::setenv("PELTA_REGISTRY", (dir_ / "registry.ini").c_str(), 1);
        ::setenv("PELTA_LOG_FOLDER", (dir_ / "logs").c_str(), 1);
        dbFile_ = (dir_ / "pelta.db").string();
        pelta::bll::createDemoDatabase(dbFile_, demoOptions());

        pelta::fw::registerFramework();
        pelta::fw::services()->reset();
        agent = pelta::makeRef<pelta::fw::ScriptedUserAgent>();
        pelta::fw::services()->setUserAgent(agent);
        ResetFrameworkServices();

        auto reg = reinterpret_cast<pelta::DllRegisterServerFn>(
            pelta::serverEntryPoint(PELTA_LIBRARY_FILE, "DllRegisterServer"));
        ASSERT_EQ(reg(), pelta::kOk);
        connect("admin");
    }

    void TearDown() override {
        pelta::fw::services()->reset();
        ResetFrameworkServices();
        ::unsetenv("PELTA_REGISTRY");
        ::unsetenv("PELTA_LOG_FOLDER");
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }

    virtual pelta::bll::DemoOptions demoOptions() const {
        pelta::bll::DemoOptions o;
        o.banks = 2;
        o.rateDays = 3;
        o.currenciesPerRate = 2;
        return o;
    }

    void connect(const std::string& user) {
        connection = pelta::makeRef<CountingConnection>(
            pelta::bll::Connection::open(dbFile_, user));
        site = pelta::makeRef<pelta::fw::ClientSite>(connection);
    }

    // A list control as the host makes it: by programmatic identifier, then
    // InitClientSite, then the framework's first fetch and fill.
    pelta::ObjectRef openList(const std::string& progId) {
        pelta::ObjectRef list = pelta::createObject(progId);
        auto control = pelta::queryRef<IZonListControl>(list);
        EXPECT_TRUE(control);
        EXPECT_TRUE(control->InitClientSite(site.get()));
        return list;
    }

    // The database as the user's data sees it: one value of a query.
    pelta::Variant scalar(const std::string& sql, const pelta::Variant& p1 = {}) {
        auto db = pelta::bll::openDatabase(dbFile_);
        auto st = db->prepare(sql);
        if (!p1.isEmpty()) st->bind(1, p1);
        return st->step() ? st->value(0) : pelta::Variant::null();
    }
    int64_t count(const std::string& sql, const pelta::Variant& p1 = {}) {
        return scalar(sql, p1).toInt64();
    }

    static pelta::fw::FormExtender* form(IFormExtender* f) {
        return dynamic_cast<pelta::fw::FormExtender*>(f);
    }
    static pelta::fw::GridExtender* grid(IGridExtender* g) {
        return dynamic_cast<pelta::fw::GridExtender*>(g);
    }

    fs::path dir_;
    std::string dbFile_;
    pelta::Ref<pelta::fw::ScriptedUserAgent> agent;
    pelta::Ref<CountingConnection> connection;
    pelta::Ref<pelta::fw::ClientSite> site;
};

}  // namespace screentest
