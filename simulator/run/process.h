// What this process was started with, and how it is asked to end.
#pragma once

namespace simulator {

// Sees to it that no file of this program's gets the place of a standard stream that was closed.
// Whether there was a standard input; programs that are started from here find it as it was.
// std::cout writes to standard output, and nothing else does: what the tool's own code prints in
// this process goes nowhere. To be called before anything is printed.
bool KeepStandardStreams();

// From here on, an interruption from the keyboard or a request to end does not end the process
// before it has cleaned up.
void CatchInterruptions();
bool IsInterrupted();
// Ends the process by the signal that came, if one came.
void EndIfInterrupted();

}  // namespace simulator
