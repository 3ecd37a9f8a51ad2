#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

// Returns the journal's descriptor, or -1 if the settings name no journal or the journal could not
// be opened. The journal is opened when the stand-in is loaded. Events are therefore recorded even
// if the process has no free descriptor later.
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
