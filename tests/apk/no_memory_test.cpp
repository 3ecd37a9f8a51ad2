// A package for whose key there is no memory.
#include <gtest/gtest.h>

#include "support/failing_malloc.h"
#include "support/log_capture.h"
#include "support/open_package.h"

namespace {

// The integers are the only part of the tool that asks for memory with malloc.
TEST(VerifyCertificate, AKeyThatFindsNoMemoryIsReportedWithItsCode) {
  const Bytes archive = MakePackage().Build();
  LogCapture log;
  const FailingMalloc failing(1);
  OpenPackage open(archive);
  EXPECT_TRUE(failing.failed());
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error("RSA could not set key: 9\n"),
                                    Error("file not verified: META-INF/CERT.SF\n")}));
}

// Each later one fails a verification, of the certificate first and then of the data.
TEST(VerifyCertificate, AVerificationThatFindsNoMemoryIsReportedWithItsCode) {
  const Bytes archive = MakePackage().Build();
  int certificates = 0, signatures = 0;
  for (int call = 2;; ++call) {
    LogCapture log;
    const FailingMalloc failing(call);
    OpenPackage open(archive);
    if (!failing.failed()) {
      EXPECT_TRUE(open.apk.IsGoodApk());
      break;
    }
    ASSERT_EQ(log.records().size(), 2u) << call;
    const bool certificate = log.records()[0] == Error("RSA could not verify certificate: 11\n");
    const bool data = log.records()[0] == Error("RSA could not verify data: 11\n");
    // The exponent alone may go missing without a word, and then nothing verifies: no padding comes
    // of a number to the power of 0.
    EXPECT_TRUE(certificate || data ||
                log.records()[0] == Error("RSA could not verify certificate: 7\n"))
        << call << ": " << log.records()[0];
    certificates += certificate;
    signatures += data;
  }
  EXPECT_EQ(certificates, signatures);
  EXPECT_GT(signatures, 5);
}

}  // namespace
