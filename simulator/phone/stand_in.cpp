#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

// Returns the journal's descriptor, or -1 if there is no journal. The journal is opened when this
// library is loaded, so that events are recorded even if the process has no free descriptor later.
int JournalDescriptor() {
  static const int journal =
      ThisPhone().journal.empty() ? -1 : OpenJournal(ThisPhone().journal.c_str());
  return journal;
}

__attribute__((constructor)) void OpenEarly() {
  const ErrnoKeeper keeper;
  JournalDescriptor();
}

}  // namespace

const PhoneSettings& ThisPhone() {
  static const PhoneSettings& phone = *new PhoneSettings(SettingsFromEnvironment());
  return phone;
}

void Record(const Event& event) {
  const ErrnoKeeper keeper;
  if (JournalDescriptor() >= 0) event.AppendTo(JournalDescriptor());
}

}  // namespace simulator
