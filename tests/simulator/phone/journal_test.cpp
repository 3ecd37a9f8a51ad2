#include "simulator/phone/journal.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <nlohmann/json.hpp>

#include "simulator/phone/probe_run.h"

using namespace simulator;

TEST(JournalEvent, IsOneLineOfJson) {
  char path[] = "/tmp/apktoolkit-journal-XXXXXX";
  const int file = mkstemp(path);
  ASSERT_GE(file, 0);
  Event event("sign");
  event.Number("fd", -3).Text("path", "/a\xe9").Hex("payload", std::string("\x00\xff\x1a", 3));
  EXPECT_TRUE(event.Null("text").AppendTo(file));
  EXPECT_EQ(ContentOf(path),
            "{\"event\":\"sign\",\"fd\":-3,\"path\":\"/a\\uf7e9\",\"payload\":\"00ff1a\","
            "\"text\":null}\n");
  close(file);
  unlink(path);
}

TEST(JournalEvent, WriteFailureIsReported) { EXPECT_FALSE(Event("journal").AppendTo(-1)); }

TEST(JournalDescriptor, IsHighAndClosedByExec) {
  const int low = dup(0);
  const int journal = OpenJournal("/dev/null");
  EXPECT_GE(journal, 64);
  EXPECT_EQ(fcntl(journal, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
  EXPECT_NE(fcntl(journal, F_GETFL) & O_APPEND, 0);
  const int next = dup(0);
  EXPECT_EQ(next, low + 1);
  for (const int fd : {low, journal, next}) close(fd);
}

TEST(JournalDescriptor, IsMinusOneForAFileThatCannotBeOpened) {
  EXPECT_EQ(OpenJournal("/nowhere/journal"), -1);
}
