#include "simulator/phone/settings.h"

#include <gtest/gtest.h>

#include <cstdlib>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// Sets environment variables ("NAME=VALUE" each). The destructor removes these variables.
class Environment {
 public:
  explicit Environment(const Lines& assignments) {
    for (const std::string& assignment : assignments) {
      const size_t equals = assignment.find('=');
      names_.push_back(assignment.substr(0, equals));
      setenv(names_.back().c_str(), assignment.c_str() + equals + 1, 1);
    }
  }
  ~Environment() {
    for (const std::string& name : names_) unsetenv(name.c_str());
  }

 private:
  Lines names_;
};

}  // namespace

TEST(PhoneEnvironment, PhoneIsHealthyWithoutVariables) {
  const PhoneSettings phone = SettingsFromEnvironment();
  EXPECT_EQ(phone.journal, "");
  EXPECT_EQ(phone.integrity, Lines({"1f"}));
  EXPECT_TRUE(phone.trusted.empty());
  EXPECT_EQ(phone.sign_errno, 0);
  EXPECT_EQ(phone.verify_errno, 126);
  EXPECT_EQ(phone.zu_result, 0);
}

TEST(PhoneEnvironment, EverySettingArrives) {
  const Environment environment(
      {"APKTOOLKIT_SIM_JOURNAL=/j", "APKTOOLKIT_SIM_INTEGRITY=ffffffff,missing,1f",
       "APKTOOLKIT_SIM_TRUST=64769:18446744073709551615,0:7", "APKTOOLKIT_SIM_SIGN_ERRNO=1",
       "APKTOOLKIT_SIM_VERIFY_ERRNO=2", "APKTOOLKIT_SIM_ZU_RESULT=-3"});
  const PhoneSettings phone = SettingsFromEnvironment();
  EXPECT_EQ(phone.journal, "/j");
  EXPECT_EQ(phone.integrity, Lines({"ffffffff", "missing", "1f"}));
  EXPECT_EQ(phone.trusted, std::vector<FileId>({{64769, 18446744073709551615U}, {0, 7}}));
  EXPECT_EQ(phone.sign_errno, 1);
  EXPECT_EQ(phone.verify_errno, 2);
  EXPECT_EQ(phone.zu_result, -3);
}

// The list item "5" has no inode number, and becomes {0, 0}. No file has the inode 0.
TEST(PhoneEnvironment, TrustedFileWithoutAnInodeIsReadAsZero) {
  const Environment environment({"APKTOOLKIT_SIM_TRUST=5,6:7"});
  EXPECT_EQ(SettingsFromEnvironment().trusted, std::vector<FileId>({{0, 0}, {6, 7}}));
}

TEST(PhoneEnvironment, IsWrittenAsItIsRead) {
  PhoneSettings phone;
  phone.journal = "/with space";
  phone.integrity = {"", "0", "missing"};
  phone.trusted = {{1, 2}, {3, 4}};
  phone.sign_errno = 5;
  phone.verify_errno = 6;
  phone.zu_result = -7;
  EXPECT_EQ(SettingsToEnvironment(phone),
            Lines({"APKTOOLKIT_SIM_JOURNAL=/with space", "APKTOOLKIT_SIM_INTEGRITY=,0,missing",
                   "APKTOOLKIT_SIM_TRUST=1:2,3:4", "APKTOOLKIT_SIM_SIGN_ERRNO=5",
                   "APKTOOLKIT_SIM_VERIFY_ERRNO=6", "APKTOOLKIT_SIM_ZU_RESULT=-7"}));
}
