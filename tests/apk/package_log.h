// The log records of opening and verifying a package.
#pragma once

#include <gtest/gtest.h>

#include "support/log_capture.h"
#include "support/open_package.h"

inline Records LogOf(const Package& package) {
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(open.apk.IsGoodApk(), log.records().empty());
  return log.records();
}

inline Records LogOf(const PackageOptions& options) { return LogOf(MakePackage(options)); }
