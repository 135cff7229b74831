// A refusal read from a response bag.
#include <gtest/gtest.h>

#include "library/frame/mdBllErrors.h"
#include "library/frame/mdClassFactory.h"
#include "platform/data/propertybag.h"
#include "tests/library/frame_support.h"

using namespace PeltaNom15;

#pragma GCC diagnostic ignored "-Wmissing-field-initializers"

namespace {

TEST(BllErrorsBag, ReadsEveryPropertyFromTheResponseBytes) {
    auto request = CreatePropertyBag(nullptr);
    ASSERT_TRUE(request);
    request->writeProperty("BllError", 20);
    request->writeProperty("BllTable", "dbo.nom_items");
    request->writeProperty("BllColumn", "Code");
    request->writeProperty("BllSqlError", "UNIQUE constraint failed");
    request->writeProperty("BllDocText", "doc");
    auto response = CreatePropertyBag(nullptr, request->contents(), {});
    ASSERT_TRUE(response);
    const BllErrorInfo e = ReadBllError(response.get());
    EXPECT_EQ(e.Code, 20);
    EXPECT_EQ(e.Table, "dbo.nom_items");
    EXPECT_EQ(e.Column, "Code");
    EXPECT_EQ(e.SqlError, "UNIQUE constraint failed");
    EXPECT_EQ(e.DocText, "doc");
    EXPECT_EQ(e.RowText, "");
}

TEST(BllErrorsBag, MalformedResponseBytesGiveNothing) {
    EXPECT_FALSE(CreatePropertyBag(nullptr, pelta::Bytes{1, 2, 3, 4, 5}, {}));
}

TEST(BllErrorsBag, ShowBllErrorShowsTheMessageAndAnswersCancel) {
    frametest::HostInstall host;
    auto response = CreatePropertyBag(nullptr);
    response->writeProperty("BllError", 10);
    EXPECT_EQ(ShowBllError(nullptr, response.get()), vbCancel);
    ASSERT_EQ(host->boxes.size(), 1u);
    EXPECT_EQ(host->boxes[0].Text, ComposeBllError({.Code = 10}).Text);
    EXPECT_EQ(host->boxes[0].Style, vbExclamation);

    auto empty = CreatePropertyBag(nullptr);
    EXPECT_EQ(ShowBllError(nullptr, empty.get()), 0);
    EXPECT_EQ(host->boxes.size(), 1u);
}

}  // namespace
