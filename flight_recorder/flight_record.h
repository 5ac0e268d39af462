// SPDX-License-Identifier: MIT
// The flight record: what was under way in a run, in 4096 bytes that outlive the process.
//
// A plain record with a fixed layout, the same bytes from a 32-bit and a 64-bit program. All numbers are
// little-endian. docs/FLIGHT_RECORD.md documents it byte by byte; whoever changes a field raises
// kFlightRecordVersion and mends that page.
//
// Written by flight_recorder/flight_recorder.h, read by flight_recorder/flight_record_reader.h.
#pragma once

#include <cstddef>
#include <cstdint>

constexpr char kFlightRecordMagic[8] = {'v', 's', 't', 'f', 'l', 'r', 'e', 'c'};
constexpr std::uint32_t kFlightRecordVersion = 1;
constexpr std::size_t kFlightRecordSizeInBytes = 4096;
constexpr std::size_t kFlightStepTextSize = 64;  ///< Sizes of texts count the terminating zero.
constexpr std::size_t kFlightPathSize = 1024;
constexpr std::size_t kFlightStepTimes = 80;

enum FlightPhase : std::uint32_t {
  kFlightNotStarted = 0,
  kFlightLoading = 1,
  kFlightCreating = 2,  ///< The first instance, until its category is known.
  kFlightRunning = 3,   ///< The steps.
  kFlightClosing = 4,   ///< The last instance.
  kFlightEnded = 5,     ///< The run is over; exit handlers may still run.
};

enum FlightVerdict : std::uint32_t {
  kFlightNoVerdict = 0,
  kFlightPassed = 1,
  kFlightShell = 2,             ///< Passed, and the plug-in is a shell.
  kFlightFailedWithCode = 3,    ///< FlightRecord::failureCode holds it.
  kFlightFailedForUnknown = 4,  ///< Something was thrown that is no int.
  kFlightNoInstance = 5,        ///< The program crashes on purpose now.
  kFlightRefused = 6,           ///< The bundle is refused by name.
};

enum FlightRequestKind : std::uint32_t {
  kFlightNoRequest = 0,
  kFlightLoad = 1,          ///< The module is loaded, and its static constructors run.
  kFlightEntry = 2,         ///< Its entry point is called.
  kFlightDispatcher = 3,    ///< Has opcode, index, value and opt.
  kFlightGetParameter = 4,  ///< Has index.
  kFlightSetParameter = 5,  ///< Has index and opt, the new value.
};

enum FlightRequestState : std::uint32_t {
  kFlightIdle = 0,      ///< No request has been made yet.
  kFlightUnderWay = 1,  ///< The plug-in has not returned.
  kFlightReturned = 2,
  kFlightThrew = 3,  ///< It was left by an exception.
};

/// A request that the host makes of the plug-in. Fields that its kind does not have are left from earlier
/// requests.
struct FlightRequest {
  std::uint32_t state;  ///< FlightRequestState
  std::uint32_t kind;   ///< FlightRequestKind
  std::int32_t opcode;
  std::int32_t index;
  std::int64_t value;  ///< Sign-extended; a pointer in some requests.
  float opt;
  std::uint32_t step;  ///< Only in FlightRecord::thrown: the step in which it was made.
};

/// A request that the plug-in makes of its host, from any thread. Two threads at a time may mix their fields.
struct FlightHostRequest {
  alignas(8) std::uint64_t count;  ///< How many there have been.
  std::int32_t opcode;
  std::int32_t index;
  alignas(8) std::int64_t value;
  std::uint32_t thread;  ///< The system's number of the thread.
  std::uint32_t unused;
};

/// The first signal that the guard handled.
struct FlightFault {
  std::int32_t signal;  ///< 0: none
  std::int32_t code;    ///< si_code: above 0 from the system, else sent by a process
  std::uint32_t thread;
  std::uint32_t sender;              ///< The process that sent the signal; 0 where the system did.
  alignas(8) std::uint64_t address;  ///< Where the memory fault, or the faulty instruction, is; else 0.
  alignas(8) std::uint64_t programCounter;
  alignas(8) std::uint64_t moduleAddress;  ///< Where the image that holds the program counter is loaded.
};

struct FlightRecord {
  char magic[8];
  std::uint32_t version;
  std::uint32_t sizeInBytes;
  std::uint32_t process;      ///< Number of the process, and of its first thread.
  std::uint32_t pointerSize;  ///< In bytes: 4 or 8.
  std::uint32_t phase;        ///< FlightPhase
  std::uint32_t verdict;      ///< FlightVerdict so far
  std::int32_t failureCode;
  std::uint32_t step;                  ///< Number of the last step line; 0 before the first.
  alignas(8) std::uint64_t startTime;  ///< CLOCK_MONOTONIC in nanoseconds, like all times here.
  std::uint32_t unexpectedExit;        ///< 1: exit() was called in the middle of the run.
  std::uint32_t unused1[3];

  alignas(8) std::uint64_t requestsMade;
  FlightRequest request;  ///< The one under way, or the last.
  unsigned char unused2[24];

  FlightHostRequest hostRequest;  ///< The last one.
  unsigned char unused3[32];

  FlightRequest thrown;  ///< The last one that was left by an exception.
  FlightFault fault;
  unsigned char unused4[56];

  char stepText[kFlightStepTextSize];
  alignas(8) std::uint64_t stepTimes[kFlightStepTimes];  ///< Step N began at stepTimes[(N - 1) % 80].

  char modulePath[kFlightPathSize];  ///< Of the image that holds the program counter; its end, if too long.
  char bundlePath[kFlightPathSize];  ///< As given on the command line; its end, if too long.
  unsigned char unused5[1024];
};

static_assert(sizeof(FlightRecord) == kFlightRecordSizeInBytes);
static_assert(offsetof(FlightRecord, magic) == 0);
static_assert(offsetof(FlightRecord, version) == 8);
static_assert(offsetof(FlightRecord, sizeInBytes) == 12);
static_assert(offsetof(FlightRecord, process) == 16);
static_assert(offsetof(FlightRecord, pointerSize) == 20);
static_assert(offsetof(FlightRecord, phase) == 24);
static_assert(offsetof(FlightRecord, verdict) == 28);
static_assert(offsetof(FlightRecord, failureCode) == 32);
static_assert(offsetof(FlightRecord, step) == 36);
static_assert(offsetof(FlightRecord, startTime) == 40);
static_assert(offsetof(FlightRecord, unexpectedExit) == 48);
static_assert(offsetof(FlightRecord, requestsMade) == 64);
static_assert(offsetof(FlightRecord, request) == 72);
static_assert(offsetof(FlightRecord, hostRequest) == 128);
static_assert(offsetof(FlightRecord, thrown) == 192);
static_assert(offsetof(FlightRecord, fault) == 224);
static_assert(offsetof(FlightRecord, stepText) == 320);
static_assert(offsetof(FlightRecord, stepTimes) == 384);
static_assert(offsetof(FlightRecord, modulePath) == 1024);
static_assert(offsetof(FlightRecord, bundlePath) == 2048);
static_assert(offsetof(FlightRecord, unused5) == 3072);

static_assert(sizeof(FlightRequest) == 32 && sizeof(FlightHostRequest) == 32 && sizeof(FlightFault) == 40);
static_assert(offsetof(FlightRequest, state) == 0 && offsetof(FlightRequest, kind) == 4);
static_assert(offsetof(FlightRequest, opcode) == 8 && offsetof(FlightRequest, index) == 12);
static_assert(offsetof(FlightRequest, value) == 16 && offsetof(FlightRequest, opt) == 24);
static_assert(offsetof(FlightRequest, step) == 28);
static_assert(offsetof(FlightHostRequest, count) == 0 && offsetof(FlightHostRequest, opcode) == 8);
static_assert(offsetof(FlightHostRequest, index) == 12 && offsetof(FlightHostRequest, value) == 16);
static_assert(offsetof(FlightHostRequest, thread) == 24);
static_assert(offsetof(FlightFault, signal) == 0 && offsetof(FlightFault, code) == 4);
static_assert(offsetof(FlightFault, thread) == 8 && offsetof(FlightFault, sender) == 12);
static_assert(offsetof(FlightFault, address) == 16 && offsetof(FlightFault, programCounter) == 24);
static_assert(offsetof(FlightFault, moduleAddress) == 32);
