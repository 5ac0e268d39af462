// SPDX-License-Identifier: MIT
#include <random>

#include <gmock/gmock.h>

#include "flight_recorder/flight_record_reader.h"
#include "flight_recorder/opcode_names.h"
#include "tests/flight_recorder/record_bytes.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"

using testing::ElementsAre;

namespace {

std::string sentence(const RecordBytes& record) {
  FlightReport report;
  std::string whyNot;
  if (!readFlightRecord(record.bytes.data(), record.bytes.size(), report, whyNot))
    return "no record: " + whyNot;
  return sentenceOf(report);
}

FlightReport reportOf(const RecordBytes& record) {
  FlightReport report;
  std::string whyNot;
  EXPECT_TRUE(readFlightRecord(record.bytes.data(), record.bytes.size(), report, whyNot)) << whyNot;
  return report;
}

RecordBytes crashed() {
  RecordBytes record = RecordBytes::ofARun();
  record.set32(224, 11).set32(228, 1).set32(232, 77).set64(248, 0x7F000004F2A1).set64(256, 0x7F0000000000);
  return record.setText(1024, "/usr/lib/vst/lsp-plugins-vst2-1.2.5.so");
}

TEST(ReadFlightRecord, TellsEveryFieldOfARun) {
  RecordBytes bytes = crashed();
  bytes.set32(20, 4).set32(24, 5).set32(28, 3).set32(32, 0xFFFFFFFF).set32(48, 1);
  bytes.set32(84, 0xFFFFFFFE).set64(88, 0xFFFFFFFFFFFFFFFF).set32(96, 0x3F000000);
  bytes.set64(128, 6).set32(136, 21).set32(140, 1).set64(144, 2).set32(152, 79);
  bytes.set32(192, 3).set32(196, 5).set32(204, 7).set32(216, 0x3F800000).set32(220, 4);
  bytes.set32(236, 80).set64(240, 0x10).setText(2048, "/usr/lib/vst/\x01\x7f.so");
  const FlightReport report = reportOf(bytes);
  EXPECT_EQ(report.process, 77u);
  EXPECT_EQ(report.pointerSize, 4u);
  EXPECT_EQ(report.phase, kFlightEnded);
  EXPECT_EQ(report.verdict, kFlightFailedWithCode);
  EXPECT_EQ(report.failureCode, -1);
  EXPECT_TRUE(report.unexpectedExit);
  EXPECT_EQ(report.step, 5u);
  EXPECT_EQ(report.stepText, "testing setting states");
  EXPECT_EQ(report.startTime, 1000u);
  EXPECT_EQ(report.firstTimedStep, 1u);
  EXPECT_THAT(report.stepTimes, ElementsAre(2000, 2001, 2002, 2003, 2004));
  EXPECT_EQ(report.requestsMade, 335u);
  EXPECT_EQ(report.request.kind, kFlightDispatcher);
  EXPECT_EQ(report.request.state, kFlightUnderWay);
  EXPECT_EQ(report.request.opcode, 44);
  EXPECT_EQ(report.request.index, -2);
  EXPECT_EQ(report.request.value, -1);
  EXPECT_EQ(report.request.opt, 0.5f);
  EXPECT_EQ(report.hostRequest.count, 6u);
  EXPECT_EQ(report.hostRequest.opcode, 21);
  EXPECT_EQ(report.hostRequest.index, 1);
  EXPECT_EQ(report.hostRequest.value, 2);
  EXPECT_EQ(report.hostRequest.thread, 79u);
  EXPECT_EQ(report.thrown.kind, kFlightSetParameter);
  EXPECT_EQ(report.thrown.index, 7);
  EXPECT_EQ(report.thrown.opt, 1.0f);
  EXPECT_EQ(report.stepOfThrown, 4u);
  EXPECT_EQ(report.fault.signal, 11);
  EXPECT_EQ(report.fault.code, 1);
  EXPECT_EQ(report.fault.thread, 77u);
  EXPECT_EQ(report.fault.sender, 80u);
  EXPECT_EQ(report.fault.address, 0x10u);
  EXPECT_EQ(report.fault.programCounter, 0x7F000004F2A1u);
  EXPECT_EQ(report.fault.modulePath, "/usr/lib/vst/lsp-plugins-vst2-1.2.5.so");
  EXPECT_EQ(report.fault.offset, 0x4F2A1u);
  EXPECT_EQ(report.bundlePath, "/usr/lib/vst/??.so");
}

TEST(ReadFlightRecord, LeavesOutWhatTheKindOfTheRequestDoesNotHave) {
  RecordBytes bytes = RecordBytes::ofARun();
  bytes.set32(76, 4).set32(84, 3).set32(96, 0x3F000000);
  const FlightReport report = reportOf(bytes);
  EXPECT_EQ(report.request.opcode, 0);
  EXPECT_EQ(report.request.index, 3);
  EXPECT_EQ(report.request.value, 0);
  EXPECT_EQ(report.request.opt, 0.0f);
}

TEST(ReadFlightRecord, TellsTheTimesOfTheLastEightySteps) {
  RecordBytes bytes = RecordBytes::ofARun();
  bytes.set32(36, 82);
  for (std::uint32_t step = 3; step <= 82; ++step) bytes.set64(384 + 8 * ((step - 1) % 80), 10000 + step);
  EXPECT_EQ(reportOf(bytes).firstTimedStep, 3u);
  EXPECT_EQ(reportOf(bytes).stepTimes.size(), 80u);
  EXPECT_EQ(reportOf(bytes).stepTimes.front(), 10003u);
  EXPECT_EQ(reportOf(bytes).stepTimes.back(), 10082u);
  bytes.set64(384 + 8 * 2, 10083);  // of step 83, whose number has not been stored
  EXPECT_EQ(reportOf(bytes).firstTimedStep, 4u);
  EXPECT_EQ(reportOf(bytes).stepTimes.size(), 79u);
}

struct Nonsense {
  std::string name;
  std::size_t offset;
  std::uint32_t number;
  std::string whyNot;
};

class NoFlightRecord : public testing::TestWithParam<Nonsense> {};

TEST_P(NoFlightRecord, SaysWhy) {
  RecordBytes bytes = crashed();
  EXPECT_EQ(sentence(bytes.set32(GetParam().offset, GetParam().number)), "no record: " + GetParam().whyNot);
}

INSTANTIATE_TEST_SUITE_P(
    Fields, NoFlightRecord,
    testing::Values(Nonsense{"Mark", 4, 0, "it does not begin with the record's mark"},
                    Nonsense{"Version", 8, 2, "its version is 2"},
                    Nonsense{"Size", 12, 4097, "it gives its size as 4097"},
                    Nonsense{"NoProcess", 16, 0, "the process is 0"},
                    Nonsense{"Process", 16, 0x80000000, "the process is 2147483648"},
                    Nonsense{"Pointers", 20, 5, "its pointers have 5 bytes"},
                    Nonsense{"Phase", 24, 6, "the phase is 6"},
                    Nonsense{"Verdict", 28, 7, "the verdict is 7"},
                    Nonsense{"Step", 36, 0x80000000, "the step is 2147483648"},
                    Nonsense{"Times", 392, 1999, "the times of the steps go backwards"},
                    Nonsense{"FirstTime", 384, 999, "the times of the steps go backwards"},
                    Nonsense{"Exit", 48, 2, "the note of an exit is 2"},
                    Nonsense{"RequestCount", 64, 0, "there is a request, but none was made"},
                    Nonsense{"NoRequest", 72, 0, "requests were made, but there is none"},
                    Nonsense{"RequestState", 72, 4, "the request's state is 4"},
                    Nonsense{"RequestKind", 76, 6, "the request's kind is 6"},
                    Nonsense{"ThrownState", 192, 1, "the request that threw has not thrown"},
                    Nonsense{"ThrownStep", 220, 6, "a request threw in a step that was not reached"},
                    Nonsense{"Signal", 224, 65, "the signal is 65"},
                    Nonsense{"NegativeSignal", 224, 0xFFFFFFFF, "the signal is -1"},
                    Nonsense{"Module", 260, 0x8000, "the module begins behind the program counter"}),
    [](const auto& instance) { return instance.param.name; });

TEST(ReadFlightRecord, TakesNoTextWithoutAnEnd) {
  EXPECT_EQ(sentence(crashed().setText(320, std::string(64, 'x'))), "no record: the step's text has no end");
  EXPECT_EQ(sentence(crashed().setText(1024, std::string(1024, 'x'))),
            "no record: the module's path has no end");
  EXPECT_EQ(sentence(crashed().setText(2048, std::string(1024, 'x'))),
            "no record: the bundle's path has no end");
}

TEST(ReadFlightRecord, TakesNoOtherSizeThan4096Bytes) {
  const std::string bytes(8192, '\0');
  FlightReport report;
  std::string whyNot;
  for (const std::size_t size : {0, 1, 4095, 4097, 8192}) {
    EXPECT_FALSE(readFlightRecord(bytes.data(), size, report, whyNot));
    EXPECT_EQ(whyNot, "it has " + std::to_string(size) + " bytes instead of 4096");
  }
  EXPECT_EQ(sentence(RecordBytes()), "no record: it does not begin with the record's mark");
}

// Whole records of noise are refused by their first bytes; so most rounds overwrite a part of a good one.
TEST(ReadFlightRecord, Outlives10000RandomOverwrites) {
  std::mt19937 random(20240229);
  int accepted = 0;
  for (int round = 0; round < 10000; ++round) {
    RecordBytes bytes = crashed();
    const std::size_t begin = round % 10 == 0 ? 0 : random() % 4096;
    const std::size_t end =
        round % 10 == 0 ? 4096 : begin + random() % std::min<std::size_t>(64, 4096 - begin) + 1;
    for (std::size_t i = begin; i < end; ++i) bytes.bytes[i] = static_cast<char>(random());
    FlightReport report;
    std::string whyNot;
    if (readFlightRecord(bytes.bytes.data(), bytes.bytes.size(), report, whyNot)) {
      ++accepted;
      EXPECT_LE(report.stepTimes.size(), 80u);
      EXPECT_LT(sentenceOf(report).size(), 4096u);
    } else {
      EXPECT_NE(whyNot, "");
      EXPECT_EQ(report.process, 0u);
    }
  }
  EXPECT_GT(accepted, 0);
  EXPECT_LT(accepted, 10000);
}

TEST(SentenceOf, TellsACrashInARequest) {
  EXPECT_EQ(sentence(crashed()),
            "step 5, testing setting states: effSetBypass (44) value 1 under way, SIGSEGV at address 0x0, in "
            "lsp-plugins-vst2-1.2.5.so+0x4f2a1");
}

TEST(SentenceOf, TellsWhoSentASignalAndOnWhichThreadItArrived) {
  RecordBytes bytes = crashed();
  bytes.set32(224, 15).set32(228, 0).set32(232, 78).set32(236, 1).set32(1024, 0);
  EXPECT_EQ(sentence(bytes),
            "step 5, testing setting states: effSetBypass (44) value 1 under way, SIGTERM sent by process 1 "
            "on another "
            "thread, at 0x7f000004f2a1 in no module");
  EXPECT_EQ(sentence(bytes.set32(224, 6).set32(236, 77).set32(232, 77).set64(248, 0)),
            "step 5, testing setting states: effSetBypass (44) value 1 under way, SIGABRT raised by itself");
}

TEST(SentenceOf, TellsAnExceptionByTheRequestThatThrewInTheSameStep) {
  RecordBytes bytes = RecordBytes::ofARun();
  bytes.set32(72, 2).set32(28, 3).set32(32, 5).set32(192, 3).set32(196, 3).set32(200, 52).set32(220, 5);
  EXPECT_EQ(sentence(bytes),
            "step 5, testing setting states: effGetTailSize (52) threw an exception, failed 5");
  EXPECT_EQ(sentence(bytes.set32(220, 4)), "step 5, testing setting states: no request under way, failed 5");
}

TEST(SentenceOf, TellsTheEndsWithoutAFault) {
  RecordBytes bytes = RecordBytes::ofARun();
  bytes.set32(72, 2).set32(24, 5).set32(28, 1);
  EXPECT_EQ(sentence(bytes), "step 5, testing setting states: no request under way, passed");
  bytes = RecordBytes::ofARun();
  EXPECT_EQ(sentence(bytes.set32(36, 0).set32(24, 1).set32(76, 1)), "loading: loading the module under way");
  EXPECT_EQ(sentence(bytes.set32(24, 2).set32(76, 2).set32(48, 1)),
            "creation: the entry point under way, exit() was called");
  EXPECT_EQ(sentence(bytes.set32(72, 2).set32(48, 0).set32(28, 5).set32(224, 11)),
            "creation: no request under way, no instance");
}

TEST(TextOfARequest, NamesArgumentsThatAreNotZero) {
  EXPECT_EQ(textOf({kFlightDispatcher, kFlightUnderWay, 0, 0, 0, 0.0f}), "effOpen (0)");
  EXPECT_EQ(textOf({kFlightDispatcher, kFlightUnderWay, 10, 1, -2, 44100.0f}),
            "effSetSampleRate (10) index 1 value -2 float 44100");
  EXPECT_EQ(textOf({kFlightDispatcher, kFlightUnderWay, -5, 0, 0, 0.0f}), "opcode -5");
  EXPECT_EQ(textOf({kFlightGetParameter, kFlightUnderWay, 0, 7, 0, 0.0f}), "getParameter 7");
  EXPECT_EQ(textOf({kFlightSetParameter, kFlightUnderWay, 0, 7, 0, 0.5f}), "setParameter 7 to 0.5");
}

TEST(EffectOpcodeName, IsTheInterfacesOwn) {
  EXPECT_STREQ(effectOpcodeName(effOpen), "effOpen");
  EXPECT_STREQ(effectOpcodeName(effClose), "effClose");
  EXPECT_STREQ(effectOpcodeName(effMainsChanged), "effMainsChanged");
  EXPECT_STREQ(effectOpcodeName(effIdentify), "effIdentify");
  EXPECT_STREQ(effectOpcodeName(effString2Parameter), "effString2Parameter");
  EXPECT_STREQ(effectOpcodeName(effConnectOutput), "effConnectOutput");
  EXPECT_STREQ(effectOpcodeName(effSetSpeakerArrangement), "effSetSpeakerArrangement");
  EXPECT_STREQ(effectOpcodeName(effSetBypass), "effSetBypass");
  EXPECT_STREQ(effectOpcodeName(effGetTailSize), "effGetTailSize");
  EXPECT_STREQ(effectOpcodeName(effGetVstVersion), "effGetVstVersion");
  EXPECT_STREQ(effectOpcodeName(effShellGetNextPlugin), "effShellGetNextPlugin");
  EXPECT_STREQ(effectOpcodeName(effGetNumMidiOutputChannels), "effGetNumMidiOutputChannels");
  EXPECT_EQ(effectOpcodeName(-1), nullptr);
  EXPECT_EQ(effectOpcodeName(80), nullptr);
}

TEST(HostOpcodeName, IsTheInterfacesOwn) {
  struct Named {
    std::int32_t opcode;
    const char* name;
  };
#define NAMED(opcode) \
  { opcode, #opcode }
  constexpr Named kAll[] = {
      NAMED(audioMasterAutomate),
      NAMED(audioMasterVersion),
      NAMED(audioMasterCurrentId),
      NAMED(audioMasterIdle),
      NAMED(audioMasterPinConnected),
      NAMED(audioMasterWantMidi),
      NAMED(audioMasterGetTime),
      NAMED(audioMasterProcessEvents),
      NAMED(audioMasterSetTime),
      NAMED(audioMasterTempoAt),
      NAMED(audioMasterGetNumAutomatableParameters),
      NAMED(audioMasterGetParameterQuantization),
      NAMED(audioMasterIOChanged),
      NAMED(audioMasterNeedIdle),
      NAMED(audioMasterSizeWindow),
      NAMED(audioMasterGetSampleRate),
      NAMED(audioMasterGetBlockSize),
      NAMED(audioMasterGetInputLatency),
      NAMED(audioMasterGetOutputLatency),
      NAMED(audioMasterGetPreviousPlug),
      NAMED(audioMasterGetNextPlug),
      NAMED(audioMasterWillReplaceOrAccumulate),
      NAMED(audioMasterGetCurrentProcessLevel),
      NAMED(audioMasterGetAutomationState),
      NAMED(audioMasterOfflineStart),
      NAMED(audioMasterOfflineRead),
      NAMED(audioMasterOfflineWrite),
      NAMED(audioMasterOfflineGetCurrentPass),
      NAMED(audioMasterOfflineGetCurrentMetaPass),
      NAMED(audioMasterSetOutputSampleRate),
      NAMED(audioMasterGetOutputSpeakerArrangement),
      NAMED(audioMasterGetVendorString),
      NAMED(audioMasterGetProductString),
      NAMED(audioMasterGetVendorVersion),
      NAMED(audioMasterVendorSpecific),
      NAMED(audioMasterSetIcon),
      NAMED(audioMasterCanDo),
      NAMED(audioMasterGetLanguage),
      NAMED(audioMasterOpenWindow),
      NAMED(audioMasterCloseWindow),
      NAMED(audioMasterGetDirectory),
      NAMED(audioMasterUpdateDisplay),
      NAMED(audioMasterBeginEdit),
      NAMED(audioMasterEndEdit),
      NAMED(audioMasterOpenFileSelector),
      NAMED(audioMasterCloseFileSelector),
      NAMED(audioMasterEditFile),
      NAMED(audioMasterGetChunkFile),
      NAMED(audioMasterGetInputSpeakerArrangement),
  };
#undef NAMED
  for (const Named& one : kAll) EXPECT_STREQ(hostOpcodeName(one.opcode), one.name);
  for (const std::int32_t unused : {-1, 5, 50}) EXPECT_EQ(hostOpcodeName(unused), nullptr);
}

}  // namespace
