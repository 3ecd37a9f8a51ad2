#include "simulator/installer/judgement.h"

#include <gtest/gtest.h>

#include "support/certificate.h"

using namespace simulator;

namespace {

std::string Hexadecimal(const Bytes& bytes) { return Hex(bytes); }

// An answer with one range of API levels. Each parameter is the JSON value of the range's member
// with the parameter's name.
std::string Answer(const std::string& verified, const std::string& signers,
                   const std::string& errors) {
  return R"({"ranges":[{"first":27,"last":2147483647,"verified":)" + verified +
         R"(,"schemes":["v2"],"signers":)" + signers + R"(,"errors":)" + errors +
         R"(,"warnings":[]}]})";
}

const std::string kSigner =
    R"([{"scheme":"v2","certificate":")" + Hexadecimal(Certificate().Build()) + R"("}])";
constexpr char kError[] = R"([{"issue":"A_FAULT","parameters":["a","b"],"text":"a b"}])";

// An answer with two ranges. Each parameter is the JSON text of one range's members "first" and
// "last".
std::string AnswerFor(const std::string& first, const std::string& second) {
  const auto range = [](const std::string& levels) {
    return "{" + levels + R"(,"verified":false,"schemes":[],"signers":[],"errors":)" + kError +
           R"(,"warnings":[]})";
  };
  return R"({"ranges":[)" + range(first) + "," + range(second) + "]}";
}

std::string WhyNone(const std::string& answer) {
  const Judgement judgement = ParseJudgement(answer);
  EXPECT_EQ(judgement.state, Judgement::State::kGaveUp) << answer;
  EXPECT_TRUE(judgement.ranges.empty());
  return judgement.why;
}

}  // namespace

TEST(Judgement, HasSchemesAndSignersOfAVerifiedPackage) {
  const Judgement judgement = ParseJudgement(Answer("true", kSigner, "[]"));
  EXPECT_EQ(judgement.state, Judgement::State::kJudged);
  ASSERT_EQ(judgement.ranges.size(), 1U);
  const RangeJudgement& range = judgement.ranges[0];
  EXPECT_EQ(range.levels.first, 27);
  EXPECT_EQ(range.levels.last, kNewestLevel);
  EXPECT_TRUE(range.is_verified);
  EXPECT_EQ(range.schemes, std::vector<std::string>({"v2"}));
  ASSERT_EQ(range.signers.size(), 1U);
  EXPECT_EQ(range.signers[0].scheme, "v2");
  EXPECT_EQ(range.signers[0].certificate.subject, "CN=Test");
  EXPECT_EQ(range.signers[0].certificate.key.bits, 2048);
}

TEST(Judgement, HasTheErrorsOfARefusedPackage) {
  const Judgement judgement = ParseJudgement(Answer("false", "[]", kError));
  ASSERT_EQ(judgement.ranges.size(), 1U);
  EXPECT_FALSE(judgement.ranges[0].is_verified);
  ASSERT_EQ(judgement.ranges[0].errors.size(), 1U);
  const InstallerIssue& error = judgement.ranges[0].errors[0];
  EXPECT_EQ(error.name, "A_FAULT");
  EXPECT_EQ(error.parameters, std::vector<std::string>({"a", "b"}));
  EXPECT_EQ(error.text, "a b");
}

TEST(Judgement, FailureIsNoAnswer) {
  EXPECT_EQ(WhyNone(R"({"failure":"java.lang.OutOfMemoryError"})"), "java.lang.OutOfMemoryError");
}

TEST(Judgement, MalformedAnswerIsNoAnswer) {
  for (const std::string& answer :
       {std::string(), std::string("nonsense"), std::string("[]"), std::string("{}"),
        std::string(R"({"ranges":[]})"), std::string(R"({"ranges":{}})"),
        std::string(R"({"ranges":[1]})"), std::string(R"({"ranges":[{"first":27}]})"),
        Answer("1", kSigner, "[]"), Answer("true", "1", "[]"), Answer("true", "[1]", "[]"),
        Answer("true", R"([{"scheme":"v2","certificate":"zz"}])", "[]"),
        Answer("true", R"([{"scheme":"v2","certificate":"300"}])", "[]"),
        Answer("true", R"([{"scheme":"v2","certificate":""}])", "[]"), Answer("false", "[]", "1"),
        Answer("false", "[]", "[1]"),
        Answer("false", "[]", R"([{"issue":"A","parameters":[1],"text":""}])")}) {
    EXPECT_EQ(WhyNone(answer), "its answer is malformed") << answer;
  }
}

// Java reads some certificates that the phone's crypto library refuses.
TEST(Judgement, SignerWithAnUnreadableCertificateIsNoAnswer) {
  EXPECT_EQ(WhyNone(Answer("true", R"([{"scheme":"v2","certificate":"3000"}])", "[]")),
            "the crypto library does not read the certificate of the v2 signer");
}

// A verified range must have a signer and no errors. A refused range must have an error.
TEST(Judgement, AnswerThatContradictsItselfIsNoAnswer) {
  EXPECT_EQ(WhyNone(Answer("true", kSigner, kError)), "its answer is malformed");
  EXPECT_EQ(WhyNone(Answer("true", "[]", "[]")), "its answer is malformed");
  EXPECT_EQ(WhyNone(Answer("false", "[]", "[]")), "its answer is malformed");
}

TEST(Judgement, RangesHaveTheOrderOfTheAnswer) {
  const Judgement judgement =
      ParseJudgement(AnswerFor(R"("first":27,"last":32)", R"("first":33,"last":2147483647)"));
  ASSERT_EQ(judgement.ranges.size(), 2U);
  EXPECT_EQ(judgement.ranges[0].levels.first, 27);
  EXPECT_EQ(judgement.ranges[0].levels.last, 32);
  EXPECT_EQ(judgement.ranges[1].levels.first, 33);
  EXPECT_EQ(judgement.ranges[1].levels.last, kNewestLevel);
}

// Without this check, the report could name phones of an API level twice, or not at all.
TEST(Judgement, AnswerWithOverlapOrGapIsNoAnswer) {
  const std::string low = R"("first":27,"last":32)", high = R"("first":33,"last":40)";
  for (const std::string& answer :
       {AnswerFor(high, low), AnswerFor(low, low), AnswerFor(low, R"("first":32,"last":40)"),
        AnswerFor(low, R"("first":34,"last":40)"), AnswerFor(low, R"("first":33,"last":32)"),
        AnswerFor(R"("first":0,"last":32)", high),
        AnswerFor(R"("first":-2147483648,"last":32)", high)}) {
    EXPECT_EQ(WhyNone(answer), "its answer is malformed") << answer;
  }
}
