// Tests the interface to the kernel: which calls are made, when no call is made, and how long the
// tool waits.
#include "sign/integrity.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <climits>
#include <cstring>

#include "support/log_capture.h"
#include "support/phone.h"

namespace {

using Events = std::vector<std::string>;

constexpr char kSelf[] = "integrity /proc/self/integrity/value";
constexpr uint8_t kPayload[] = {3, 0, 0xaa, 0xbb, 0xcc};  // length 3, then 3 bytes

// The result codes are part of the interface: 0 for success, and 65536 for every failure. The code
// does not depend on the cause, nor on the kernel's error number.
TEST(VeltResultCode, EveryFailureIs65536) {
  constexpr uint32_t kFailure = 65536;
  Phone phone;
  uint32_t value;
  EXPECT_EQ(VeltSignFd(7, nullptr), kFailure);
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0, nullptr), kFailure);
  EXPECT_EQ(VeltTaskReadIntegrity(-1, 0, &value), kFailure);
  // Only the kernel's result 0 is success. Results above and below 0 are failures.
  for (const int result : {1, 2, -2, 65536, INT_MAX, INT_MIN}) {
    phone.kernel_result = result;
    EXPECT_EQ(VeltSignFd(7, kPayload), kFailure) << result;
    EXPECT_EQ(VeltVerifyFd(7), kFailure) << result;
  }
  phone.sign_errno = phone.verify_errno = EACCES;
  EXPECT_EQ(VeltSignFd(7, kPayload), kFailure);
  EXPECT_EQ(VeltVerifyFd(7), kFailure);
  for (const char* text : {Phone::kNoFile, "", "no number"}) {
    phone.integrity = {text};
    EXPECT_EQ(VeltSignFd(7, kPayload), kFailure) << text;
    EXPECT_EQ(VeltTaskReadIntegrity(0, 1, &value), kFailure) << text;
  }
  phone.integrity = {"0"};
  EXPECT_EQ(VeltSignFd(7, kPayload), kFailure);
}

TEST(VeltSignFd, SignsWithThePayloadAfterReadingItsOwnIntegrity) {
  Phone phone;
  EXPECT_EQ(VeltSignFd(7, kPayload), 0U);
  EXPECT_EQ(phone.events, Events({kSelf, "sign 7 0300aabbcc"}));
}

TEST(VeltSignFd, EmptyPayloadIsTwoZeroBytes) {
  Phone phone;
  const uint8_t empty[2] = {};
  EXPECT_EQ(VeltSignFd(7, empty), 0U);
  EXPECT_EQ(phone.events, Events({kSelf, "sign 7 0000"}));
}

TEST(VeltSignFd, NullPayloadFailsWithoutAskingProcOrTheKernel) {
  Phone phone;
  EXPECT_EQ(VeltSignFd(7, nullptr), 0x10000U);
  EXPECT_EQ(phone.events, Events());
}

TEST(VeltSignFd, IntegrityOf0PreventsSigning) {
  Phone phone;
  phone.integrity = {"0\n"};
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(phone.events, Events({kSelf}));
}

TEST(VeltSignFd, SmallestAndLargestSettledValuesAllowSigning) {
  for (const char* value : {"1", "fffffffe"}) {
    Phone phone;
    phone.integrity = {value};
    EXPECT_EQ(VeltSignFd(7, kPayload), 0U) << value;
    EXPECT_EQ(phone.events, Events({kSelf, "sign 7 0300aabbcc"})) << value;
  }
}

TEST(VeltSignFd, WaitsInStepsOf10MillisecondsUntilTheValueSettles) {
  Phone phone;
  phone.integrity = {"ffffffff\n", "ffffffff\n", "1f\n"};
  EXPECT_EQ(VeltSignFd(7, kPayload), 0U);
  EXPECT_EQ(phone.events,
            Events({kSelf, "sleep 10000", kSelf, "sleep 10000", kSelf, "sign 7 0300aabbcc"}));
}

// The value settles after 10000 steps of 10 ms, which are 100 seconds. The Phone does not really
// sleep.
TEST(VeltSignFd, WaitsEven100SecondsUntilTheValueSettles) {
  constexpr size_t kSteps = 10000;
  Phone phone;
  phone.integrity.assign(kSteps, "ffffffff\n");
  phone.integrity.push_back("1f\n");
  EXPECT_EQ(VeltSignFd(7, kPayload), 0U);
  EXPECT_EQ(phone.events.size(), 2 * kSteps + 2);
  EXPECT_EQ(phone.events.back(), "sign 7 0300aabbcc");
}

TEST(VeltSignFd, ValueThatSettlesTo0PreventsSigning) {
  Phone phone;
  phone.integrity = {"ffffffff\n", "0\n"};
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(phone.events, Events({kSelf, "sleep 10000", kSelf}));
}

TEST(VeltSignFd, MissingIntegrityFilePreventsSigning) {
  Phone phone;
  phone.integrity = {Phone::kNoFile};
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(phone.events, Events({kSelf}));
}

TEST(VeltSignFd, RefusalByTheKernelKeepsItsErrno) {
  Phone phone;
  phone.sign_errno = EPERM;
  errno = 0;
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(errno, EPERM);
}

TEST(VeltSignFd, IntegrityFileMissingAfterTheWaitPreventsSigning) {
  Phone phone;
  phone.integrity = {"ffffffff\n", Phone::kNoFile};
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(phone.events, Events({kSelf, "sleep 10000", kSelf}));
}

TEST(VeltVerifyFd, TrustedFileGives0WithoutReadingTheIntegrity) {
  Phone phone;
  EXPECT_EQ(VeltVerifyFd(9), 0U);
  EXPECT_EQ(phone.events, Events({"verify 9"}));
}

TEST(VeltVerifyFd, UnsignedFileFailsWithTheKernelsErrno) {
  Phone phone;
  phone.verify_errno = ENOKEY;
  errno = 0;
  EXPECT_EQ(VeltVerifyFd(9), 0x10000U);
  EXPECT_EQ(errno, ENOKEY);
}

TEST(VeltVerifyFd, KernelWithoutTheFeatureRefuses) {
  // Without a Phone, this machine's own kernel answers. It does not know the command.
  errno = 0;
  EXPECT_EQ(VeltVerifyFd(0), 0x10000U);
  EXPECT_EQ(errno, EINVAL);
}

TEST(VeltTaskReadIntegrity, ProcessId0ReadsTheFileOfTheCaller) {
  Phone phone;
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0, &value), 0U);
  EXPECT_EQ(value, 0x1fU);
  EXPECT_EQ(phone.events, Events({kSelf}));
}

TEST(VeltTaskReadIntegrity, OtherProcessIdReadsTheFileOfThatTask) {
  Phone phone;
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(42, 0, &value), 0U);
  EXPECT_EQ(value, 0x1fU);
  EXPECT_EQ(phone.events, Events({"integrity /proc/42/integrity/value"}));
}

TEST(VeltTaskReadIntegrity, NegativeProcessIdFailsWithoutOpeningAnything) {
  Phone phone;
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(-1, 0, &value), 0x10000U);
  EXPECT_EQ(value, 5U);
  EXPECT_EQ(phone.events, Events());
  EXPECT_EQ(phone.other_fopens, 0);
}

TEST(VeltTaskReadIntegrity, NullValueFailsWithoutReadingTheFile) {
  Phone phone;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0, nullptr), 0x10000U);
  EXPECT_EQ(phone.events, Events());
}

TEST(VeltTaskReadIntegrity, TextThatIsNotHexadecimalLeavesTheValueUnchanged) {
  for (const uint32_t wait : {0U, 1U}) {
    Phone phone;
    phone.integrity = {"settled\n"};
    uint32_t value = 5;
    EXPECT_EQ(VeltTaskReadIntegrity(0, wait, &value), 0x10000U);
    EXPECT_EQ(value, 5U);
    EXPECT_EQ(phone.events, Events({kSelf}));
  }
}

TEST(VeltTaskReadIntegrity, EmptyFileFails) {
  Phone phone;
  phone.integrity = {""};
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0, &value), 0x10000U);
  EXPECT_EQ(value, 5U);
}

TEST(VeltTaskReadIntegrity, UnsettledValueIsReturnedWithoutWaiting) {
  Phone phone;
  phone.integrity = {"ffffffff\n", "1f\n"};
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0, &value), 0U);
  EXPECT_EQ(value, 0xFFFFFFFFU);
  EXPECT_EQ(phone.events, Events({kSelf}));
}

TEST(VeltTaskReadIntegrity, OnlyBit0AsksToWait) {
  Phone phone;
  phone.integrity = {"ffffffff\n", "1f\n"};
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 0xFFFFFFFE, &value), 0U);
  EXPECT_EQ(value, 0xFFFFFFFFU);
  EXPECT_EQ(VeltTaskReadIntegrity(0, 3, &value), 0U);
  EXPECT_EQ(value, 0x1fU);
}

TEST(VeltTaskReadIntegrity, FileThatGoesBadWhileWaitingFailsWithTheLastValueRead) {
  Phone phone;
  phone.integrity = {"ffffffff\n", "gone\n"};
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 1, &value), 0x10000U);
  EXPECT_EQ(value, 0xFFFFFFFFU);
  EXPECT_EQ(phone.events, Events({kSelf, "sleep 10000", kSelf}));
}

TEST(VeltTaskReadIntegrity, FileMissingAfterTheWaitFailsWithTheLastValueRead) {
  Phone phone;
  phone.integrity = {"ffffffff\n", Phone::kNoFile};
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 1, &value), 0x10000U);
  EXPECT_EQ(value, 0xFFFFFFFFU);
  EXPECT_EQ(phone.events, Events({kSelf, "sleep 10000", kSelf}));
}

TEST(VeltTaskReadIntegrity, WritesNothingToTheLog) {
  Phone phone;
  phone.integrity = {Phone::kNoFile};
  LogCapture log;
  uint32_t value = 5;
  EXPECT_EQ(VeltTaskReadIntegrity(0, 1, &value), 0x10000U);
  EXPECT_EQ(VeltSignFd(7, kPayload), 0x10000U);
  EXPECT_EQ(log.records(), Records());
}

}  // namespace
