#include "simulator/show/timeline.h"

#include <gtest/gtest.h>

#include <sstream>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// A journal's events as a timeline.
std::string Printed(const std::string& journal, bool colours = false) {
  std::ostringstream out;
  const Look look = {colours, true};
  PrintTimeline(MakeTimeline(ParseEvents(journal), "/data/app/base.apk"), look, out);
  return out.str();
}

const std::string kStart = R"({"event":"start","file":"base.apk","path":"/data/app/base.apk"}
{"event":"attached","pid":7}
)";
const std::string kSigned =
    R"({"event":"sign","fd":3,"path":"/data/app/base.apk","payload":"0100ab","result":0,"errno":0}
)";
const std::string kExit = "{\"event\":\"exit\",\"status\":0}\n";
const std::string kDigest(64, '7');

}  // namespace

TEST(Timeline, ShowsTheStepsOfAGoodPackage) {
  const std::string journal =
      kStart +
      R"({"event":"log","priority":4,"tag":"ApkToolkit","text":"VeltSignJni starts: 3.\n"}
{"event":"integrity","pid":0,"text":"ffffffff"}
{"event":"integrity","pid":0,"text":"ffffffff"}
{"event":"integrity","pid":0,"text":"1f"}
{"event":"sign","fd":4,"path":"/data/app/lib/arm64/libfoo.so","payload":"2000)" +
      kDigest + R"(","result":0,"errno":0}
{"event":"sign","fd":4,"path":"/data/app/lib/arm64/libbar.so","payload":"0100ab","result":0,"errno":0}
)" + kSigned +
      R"({"event":"register","fd":3,"path":"/data/app/base.apk","name":"com.app","data":")" +
      kDigest + R"(","result":0}
)" + kExit;
  EXPECT_EQ(Printed(journal), R"(   1  log        VeltSignJni starts: 3.
   2  integrity  the tool's own value reads ffffffff, not settled yet (2 times)
   3  integrity  the tool's own value reads 1f
   4  sign       lib/arm64/libfoo.so: signed
                 payload: length 32, SHA-256 digest of the signer's key )" +
                                  kDigest + R"(
   5  sign       lib/arm64/libbar.so: signed
                 payload: length 1, ab
   6  sign       base.apk: signed
                 payload: length 1, ab
   7  register   com.app: libzu answers 0
                 key: length 32, 77777777777777777777777777777777...
   8  exit       status 0
)");
}

TEST(Timeline, FailuresAreShownInRed) {
  const std::string journal = kStart + R"({"event":"integrity","pid":0,"text":null}
{"event":"integrity","pid":42,"text":"zz"}
{"event":"verify","fd":3,"path":"/data/app/base.apk","result":-1,"errno":126}
{"event":"sign","fd":9,"path":"","payload":"","result":-1,"errno":9}
{"event":"log","priority":6,"tag":"ApkToolkit","text":"bad"}
{"event":"log","priority":5,"tag":"ziparchive","text":"so so"}
{"event":"register","fd":3,"path":"/data/app/base.apk","name":"com.app","data":"ab","result":5}
{"event":"stdout","text":"CERT\n"}
{"event":"exit","signal":11}
)";
  const std::string timeline =
      R"(   1  integrity  there is no file for the tool's own value
   2  integrity  the value of task 42 reads zz
   3  verify     base.apk: ENOKEY: Required key not available
   4  sign       : EBADF: Bad file descriptor
                 no readable payload
   5  error      bad
   6  warning    [ziparchive] so so
   7  register   com.app: libzu answers 5
                 key: length 1, ab
   8  stdout     CERT
   9  exit       killed by signal 11
)";
  EXPECT_EQ(Printed(journal), timeline);

  // With colours, only the colour codes are added. Six failures are red.
  std::string coloured = Printed(journal, true);
  int red = 0;
  for (const std::string code : {"\x1b[31m", "\x1b[0m"}) {
    for (size_t at; (at = coloured.find(code)) != std::string::npos; ++red) {
      coloured.erase(at, code.size());
    }
  }
  EXPECT_EQ(coloured, timeline);
  EXPECT_EQ(red, 2 * 6);
}

TEST(Timeline, EmptyPayloadIsShownAsNoData) {
  const std::string journal =
      kStart +
      R"({"event":"sign","fd":3,"path":"/data/app/base.apk","payload":"0000","result":0,"errno":0}
)" + kExit;
  EXPECT_EQ(Printed(journal), R"(   1  sign       base.apk: signed
                 payload: length 0, no data
   2  exit       status 0
)");
}

TEST(Timeline, OnlyAPayloadOf32BytesIsCalledADigest) {
  const auto payload = [](const std::string& data) {
    const Events events = ParseEvents("{\"event\":\"sign\",\"path\":\"/a\",\"payload\":\"0000" +
                                      data + "\",\"result\":0}\n");
    return MakeTimeline(events, "/a").at(0).detail;
  };
  EXPECT_EQ(payload("abcdef"), "payload: length 3, abcdef");
  EXPECT_EQ(payload(kDigest + "77"), "payload: length 33, " + kDigest + "77");
  EXPECT_EQ(payload(kDigest), "payload: length 32, SHA-256 digest of the signer's key " + kDigest);
}

TEST(Timeline, EndsThatAreFailuresAreMarked) {
  const auto is_failure = [](const std::string& end) {
    return MakeTimeline(ParseEvents("{\"event\":\"exit\"," + end + "}\n"), "/a").at(0).is_failure;
  };
  EXPECT_FALSE(is_failure("\"status\":0"));
  EXPECT_TRUE(is_failure("\"status\":1"));
  EXPECT_TRUE(is_failure("\"signal\":9"));
}

TEST(Timeline, ControlCharactersAreShownAsBytes) {
  const std::string journal =
      kStart + R"({"event":"log","priority":4,"tag":"\u001b[2J","text":"a\u0007\u009b\uf7e9é\nb\n"}
)" + kExit;
  EXPECT_EQ(LinesOf(Printed(journal))[0],
            "   1  log        [\\x1b[2J] a\\x07\\xc2\\x9b\\xe9é\\x0ab");
}

TEST(Timeline, UnknownEventIsShownAsJson) {
  EXPECT_EQ(LinesOf(Printed(kStart + "{\"event\":\"later\",\"a\":1}\n" + kExit))[0],
            "   1  later      {\"a\":1,\"event\":\"later\"}");
}

TEST(Timeline, ControlCharactersOfAnUnknownEventAreEscaped) {
  EXPECT_EQ(LinesOf(Printed(kStart + "{\"event\":\"\\u001b\\uf7e9\"}\n" + kExit))[0],
            "   1  \\x1b\\xe9   {\"event\":\"\\u001b\uf7e9\"}");
}

// The line once was cut inside the "é", which left a byte that is not UTF-8.
TEST(Timeline, LongNameOfAnUnknownEventIsShownWhole) {
  const std::string name = std::string(56, 'a') + "éb";
  EXPECT_EQ(LinesOf(Printed("{\"event\":\"" + name + "\"}\n"))[0],
            "   1  " + name + "  {\"event\":\"" + name + "\"}");
}
