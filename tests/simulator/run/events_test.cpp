#include "simulator/run/events.h"

#include <gtest/gtest.h>

#include <cerrno>

using namespace simulator;

namespace {

using Json = nlohmann::json;

}  // namespace

TEST(Events, AreTheLinesWithJsonObjects) {
  const Events events = ParseEvents("{\"event\":\"a\"}\nno JSON\n[1]\n{\"event\":\"b\"}\n{\"event");
  ASSERT_EQ(events.size(), 2U);
  EXPECT_EQ(TextOf(events[0], "event"), "a");
  EXPECT_EQ(TextOf(events[1], "event"), "b");
}

TEST(Events, TextsAreDecodedToTheirBytes) {
  EXPECT_EQ(TextOf(Json::parse(R"({"a":"x\uf7e9"})"), "a"), "x\xe9");
  EXPECT_EQ(TextOf(Json::parse(R"({"a":5})"), "a"), "");
  EXPECT_EQ(TextOf(Json::parse(R"({"a":"x"})"), "b"), "");
}

TEST(Events, NumbersAreWholeOrZero) {
  EXPECT_EQ(NumberOf(Json::parse(R"({"a":-7})"), "a"), -7);
  EXPECT_EQ(NumberOf(Json::parse(R"({"a":"7"})"), "a"), 0);
  EXPECT_EQ(NumberOf(Json::parse(R"({"a":7.5})"), "a"), 0);
  EXPECT_EQ(NumberOf(Json::parse(R"({})"), "a"), 0);
}

// A `result` that is missing or not a number does not count as success.
TEST(Events, SuccessIsTheResultZero) {
  EXPECT_TRUE(IsSuccess(Json::parse(R"({"result":0})")));
  EXPECT_FALSE(IsSuccess(Json::parse(R"({"result":-1})")));
  EXPECT_FALSE(IsSuccess(Json::parse(R"({"result":"0"})")));
  EXPECT_FALSE(IsSuccess(Json::parse(R"({"result":null})")));
  EXPECT_FALSE(IsSuccess(Json::parse(R"({})")));
}

TEST(Events, AllExceptTheJournalsOwnEventsBelongToTheRun) {
  for (const char* kind : {"journal", "start", "attached", "verdict"}) {
    EXPECT_FALSE(IsOfTheRun({{"event", kind}})) << kind;
  }
  for (const char* kind : {"log", "sign", "verify", "register", "stdout", "exit", "later"}) {
    EXPECT_TRUE(IsOfTheRun({{"event", kind}})) << kind;
  }
}

TEST(Events, ErrorsHaveTheirNames) {
  EXPECT_EQ(DescribeErrno(ENOKEY), "ENOKEY: Required key not available");
  EXPECT_EQ(DescribeErrno(4095), "error 4095");
}
