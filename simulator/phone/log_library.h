// The platform's log library, as the simulator stands in for it.
//
// Two generations of it are in use: up to API level 29 a writer hands a record over as an
// `__android_logger_data` with the text beside it, later as an `__android_log_message` with the
// text inside. Only this file sees the difference. Texts and records belong to the caller, and are
// read during the call alone.
#pragma once

#include <android/log.h>

#include <type_traits>

// Each is defined by one of the generations alone.
struct __android_logger_data;
struct __android_log_message;

namespace simulator {

template <typename Record, typename = void>
inline constexpr bool kLogLibraryHas = false;
template <typename Record>
inline constexpr bool kLogLibraryHas<Record, std::void_t<decltype(sizeof(Record))>> = true;

// Calls `write(priority, tag, text)` with what a record of either generation holds; not at all with
// one that the library at hand does not have, since nothing can hold anything then.
template <typename Data, typename Write>
void ReadLogRecord(const Data* data, const char* text, Write write) {
  if constexpr (kLogLibraryHas<Data>) write(data->priority, data->tag, text);
}
template <typename Message, typename Write>
void ReadLogRecord(const Message* message, Write write) {
  if constexpr (kLogLibraryHas<Message>) write(message->priority, message->tag, message->message);
}

}  // namespace simulator
