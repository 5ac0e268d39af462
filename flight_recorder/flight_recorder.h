// SPDX-License-Identifier: MIT
// Writes the flight record: what is under way, stored before it begins.
//
//   RequestUnderWay request(opcode, index, value, opt);
//   const VstIntPtr answer = effect.dispatcher(...);
//   request.returned();
//
// Every program that loads plug-ins does these stores. They go to a static record that nobody sees, unless
// a file is mapped in its place (flight_recorder/record_file.h). No lock, no clock, and no question whether
// anybody reads along.
//
// Threads: requests, steps, phases and verdicts on the main thread; noteHostRequest() on any; noteFault() in
//          signal handlers of any thread.
#pragma once

#include <string_view>

#include "flight_recorder/flight_record.h"

#ifdef __aarch64__
constexpr std::size_t kLargestPageInBytes = 16384;
#else
constexpr std::size_t kLargestPageInBytes = 4096;
#endif

/// The record that all stores go to, in a page of its own, at an address that the compiler knows: a request to a
/// plug-in that just tells a value is so short that looking up the record would be seen.
struct alignas(kLargestPageInBytes) FlightRecordPage {
  FlightRecord record;
};
extern FlightRecordPage gFlightRecordPage;

/// Volatile, so that each store is made, and in its place: the process may be killed at any instruction.
inline volatile FlightRecord& flightRecord() { return gFlightRecordPage.record; }

/// Starts the record over. `observed` is the same memory at another address, for the notes of faults; it must
/// live as long as the process.
void observeRun(FlightRecord& observed, std::uint32_t process);

/// From now on nothing is stored in the observed record. For processes that the plug-in has forked: they
/// share it.
void forgetObservedRun();

// A benchmark is built without the stores of requests, to measure what they cost.
#ifdef VSTTORTURE_WITHOUT_STORES
constexpr bool kStoresRequests = false;
#else
constexpr bool kStoresRequests = true;
#endif

/// A request to the plug-in, from just before it is made until it is left by a return or an exception.
class RequestUnderWay {
 public:
  /// Loading, or a call of the entry point.
  explicit RequestUnderWay(FlightRequestKind kind) { begin(flightRecord(), kind); }
  /// The dispatcher is called.
  RequestUnderWay(std::int32_t opcode, std::int32_t index, std::int64_t value, float opt) {
    if (!kStoresRequests) return;
    volatile FlightRecord& record = flightRecord();
    record.request.opcode = opcode;
    record.request.index = index;
    record.request.value = value;
    record.request.opt = opt;
    begin(record, kFlightDispatcher);
  }
  ~RequestUnderWay() {
    if (!hasReturned) noteThrown();
  }
  RequestUnderWay(const RequestUnderWay&) = delete;
  RequestUnderWay& operator=(const RequestUnderWay&) = delete;

  void returned() {
    if (kStoresRequests) flightRecord().request.state = kFlightReturned;
    hasReturned = true;
  }

 private:
  friend class ValuesUnderWay;

  static void begin(volatile FlightRecord& record, FlightRequestKind kind) {
    record.request.kind = kind;
    record.requestsMade = record.requestsMade + 1;
    record.request.state = kFlightUnderWay;
  }
  static void noteThrown();

  bool hasReturned = false;
};

/// Values of parameters that are read or set in a row: one store for each that is read, since a simple plug-in
/// answers so fast that more would be seen.
///
/// The row is one request that stays under way until its end, also in the few instructions between two values;
/// its index is always that of the last one. The count of requests is brought up to date at the row's end.
class ValuesUnderWay {
 public:
  /// Just before the first value is read.
  void begin(std::int32_t index) {
    if (!kStoresRequests) return;
    flightRecord().request.index = index;
    flightRecord().request.kind = kFlightGetParameter;
    flightRecord().request.state = kFlightUnderWay;
  }
  void end() {
    if (!kStoresRequests) return;
    flightRecord().requestsMade = flightRecord().requestsMade + made;
    flightRecord().request.state = kFlightReturned;
  }

  /// Just before a value is read, and set.
  void reads(std::int32_t index) {
    if (!kStoresRequests) return;
    flightRecord().request.index = index;
    ++made;
  }
  void sets(float newValue) {
    if (!kStoresRequests) return;
    flightRecord().request.opt = newValue;
    flightRecord().request.kind = kFlightSetParameter;
    ++made;
  }
  void hasSet() {
    if (kStoresRequests) flightRecord().request.kind = kFlightGetParameter;
  }

  /// The plug-in has thrown; the row goes on.
  void hasThrown();

 private:
  std::uint64_t made = 0;
};

/// The plug-in asks its host for something, on any thread.
void noteHostRequest(std::int32_t opcode, std::int32_t index, std::int64_t value, std::uint32_t thread);

/// Takes the time.
void noteStep(int number, const char* text);

inline void notePhase(FlightPhase phase) { flightRecord().phase = phase; }
inline void noteVerdict(FlightVerdict verdict) { flightRecord().verdict = verdict; }
void noteFailure(int code);

/// The bundle as named on the command line.
void noteBundle(std::string_view path);

/// exit() has been called in the middle of the run. Later stores no longer reach the record, so that it stays
/// as it was at that moment although other threads may go on; a fault that follows still does.
void noteUnexpectedExit();

/// Stores the signal and answers true for the first fault of an observed run. Other stores no longer reach
/// the record from then on. Safe in a signal handler, like the two below.
bool noteFault(int signal);

struct FaultDetails {
  std::int32_t code;  ///< As in FlightFault, like all that follow.
  std::uint32_t thread;
  std::uint32_t sender;
  std::uint64_t address;
  std::uint64_t programCounter;
};

/// For the one caller that noteFault() answered with true.
void noteFaultDetails(const FaultDetails& details);
/// The same: the image that holds the program counter.
void noteFaultModule(const char* path, std::uint64_t address);
