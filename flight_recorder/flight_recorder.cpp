// SPDX-License-Identifier: MIT
#include "flight_recorder/flight_recorder.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <ctime>

#include <sys/mman.h>

namespace {

std::atomic<volatile FlightRecord*> observedRecord{nullptr};
std::atomic<bool> isFaultNoted{false};

std::uint64_t nowInNanoseconds() {
  timespec now = {};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return static_cast<std::uint64_t>(now.tv_sec) * 1000000000u + static_cast<std::uint64_t>(now.tv_nsec);
}

/// Stores the text's beginning, and zeros behind it.
template <std::size_t size>
void storeText(volatile char (&field)[size], std::string_view text) {
  const std::size_t length = std::min(text.size(), size - 1);
  for (std::size_t i = 0; i < size; ++i) field[i] = i < length ? text[i] : '\0';
}

/// The same with the path's end, which names the file.
template <std::size_t size>
void storePath(volatile char (&field)[size], std::string_view path) {
  storeText(field, path.substr(path.size() - std::min(path.size(), size - 1)));
}

/// Puts memory that nobody sees in the place of the record, for all stores that still come. One system call, so
/// that no thread ever stores into nothing.
void leaveRecordAsItIs() {
  // Where that fails, the stores go on: nothing better can be done.
  static_cast<void>(mmap(&gFlightRecordPage, sizeof gFlightRecordPage, PROT_READ | PROT_WRITE,
                         MAP_PRIVATE | MAP_ANON | MAP_FIXED, -1, 0));
}

}  // namespace

FlightRecordPage gFlightRecordPage = {};

void observeRun(FlightRecord& observed, std::uint32_t process) {
  FlightRecord fresh = {};
  std::memcpy(fresh.magic, kFlightRecordMagic, sizeof fresh.magic);
  fresh.version = kFlightRecordVersion;
  fresh.sizeInBytes = sizeof fresh;
  fresh.process = process;
  fresh.pointerSize = sizeof(void*);
  fresh.startTime = nowInNanoseconds();
  observed = fresh;
  isFaultNoted = false;
  observedRecord = &observed;
}

void forgetObservedRun() {
  if (observedRecord.exchange(nullptr) != nullptr) leaveRecordAsItIs();
}

void RequestUnderWay::noteThrown() {
  volatile FlightRecord& record = flightRecord();
  record.request.state = kFlightThrew;
  record.thrown.state = kFlightThrew;
  record.thrown.kind = record.request.kind;
  record.thrown.opcode = record.request.opcode;
  record.thrown.index = record.request.index;
  record.thrown.value = record.request.value;
  record.thrown.opt = record.request.opt;
  record.thrown.step = record.step;
}

void ValuesUnderWay::hasThrown() {
  RequestUnderWay::noteThrown();
  flightRecord().request.kind = kFlightGetParameter;
  flightRecord().request.state = kFlightUnderWay;
}

void noteHostRequest(std::int32_t opcode, std::int32_t index, std::int64_t value, std::uint32_t thread) {
  volatile FlightHostRequest& request = flightRecord().hostRequest;
  __atomic_store_n(&request.opcode, opcode, __ATOMIC_RELAXED);
  __atomic_store_n(&request.index, index, __ATOMIC_RELAXED);
  __atomic_store_n(&request.value, value, __ATOMIC_RELAXED);
  __atomic_store_n(&request.thread, thread, __ATOMIC_RELAXED);
  __atomic_fetch_add(&request.count, 1, __ATOMIC_RELAXED);
}

void noteStep(int number, const char* text) {
  volatile FlightRecord& record = flightRecord();
  const auto step = static_cast<std::uint32_t>(number);
  if (step > 0) record.stepTimes[(step - 1) % kFlightStepTimes] = nowInNanoseconds();
  storeText(record.stepText, text);
  record.step = step;
}

void noteFailure(int code) {
  flightRecord().failureCode = code;
  noteVerdict(kFlightFailedWithCode);
}

void noteBundle(std::string_view path) { storePath(flightRecord().bundlePath, path); }

void noteUnexpectedExit() {
  flightRecord().unexpectedExit = 1;
  if (observedRecord != nullptr) leaveRecordAsItIs();
}

bool noteFault(int signal) {
  volatile FlightRecord* record = observedRecord;
  if (record == nullptr || isFaultNoted.exchange(true)) return false;
  leaveRecordAsItIs();
  record->fault.signal = signal;
  return true;
}

void noteFaultDetails(const FaultDetails& details) {
  volatile FlightRecord* record = observedRecord;
  if (record == nullptr) return;
  record->fault.code = details.code;
  record->fault.thread = details.thread;
  record->fault.sender = details.sender;
  record->fault.address = details.address;
  record->fault.programCounter = details.programCounter;
}

void noteFaultModule(const char* path, std::uint64_t address) {
  volatile FlightRecord* record = observedRecord;
  if (record == nullptr) return;
  storePath(record->modulePath, path);
  record->fault.moduleAddress = address;
}
