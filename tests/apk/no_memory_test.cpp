// Tests that the verification of a package fails if an allocation fails.
#include <gtest/gtest.h>

#include "support/failing_malloc.h"
#include "support/log_capture.h"
#include "support/open_package.h"

namespace {

// In the tool's code, only the large integers are allocated with malloc. The first allocation is
// for the key's modulus.
TEST(VerifyCertificate, FailedAllocationForTheKeyIsReportedWithCode9) {
  const Bytes archive = MakePackage().Build();
  LogCapture log;
  const FailingMalloc failing(1);
  OpenPackage open(archive);
  EXPECT_TRUE(failing.failed());
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error("RSA could not set key: 9\n"),
                                    Error("file not verified: META-INF/CERT.SF\n")}));
}

// The second allocation is for the key's exponent. The next allocations belong to the verification
// of the certificate. The last allocations belong to the verification of the signature file. The
// log calls this file "data". If an allocation fails, the verification that needs the memory fails.
TEST(VerifyCertificate, FailedAllocationInTheVerificationIsReported) {
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
    // Code 7: the allocation for the exponent failed. rsa_set_key does not report this, and the
    // exponent is then 0. No signature verifies with this exponent: any number to the power of 0
    // is 1, and 1 has no valid padding.
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
