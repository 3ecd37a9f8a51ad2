// The records of the platform's log library.
//
// The library has two generations. Up to API level 29, a record is an `__android_logger_data`, and
// the text is a separate argument. In later levels, a record is an `__android_log_message`, which
// contains the text. ReadLogRecord hides this difference. Texts and records belong to the caller.
// ReadLogRecord keeps no pointer to them.
#pragma once

#include <android/log.h>

#include <type_traits>

// Each generation of the library defines only one of these types.
struct __android_logger_data;
struct __android_log_message;

namespace simulator {

template <typename Record, typename = void>
inline constexpr bool kLogLibraryHas = false;
template <typename Record>
inline constexpr bool kLogLibraryHas<Record, std::void_t<decltype(sizeof(Record))>> = true;

// Calls `write(priority, tag, text)` with the contents of a record of either generation. Does
// nothing for a record type that the installed library does not define: no such record exists.
template <typename Data, typename Write>
void ReadLogRecord(const Data* data, const char* text, Write write) {
  if constexpr (kLogLibraryHas<Data>) write(data->priority, data->tag, text);
}
template <typename Message, typename Write>
void ReadLogRecord(const Message* message, Write write) {
  if constexpr (kLogLibraryHas<Message>) write(message->priority, message->tag, message->message);
}

}  // namespace simulator
