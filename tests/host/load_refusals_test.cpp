// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData: which data is refused without a request, and which is just accepted.
#include <cstdint>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using preset_bytes::bankChunk;
using preset_bytes::header;
using preset_bytes::program;
using preset_bytes::programChunk;
using preset_bytes::with;
using preset_bytes::word;
using testing::IsEmpty;

// This plug-in takes chunks, parameters and programs.
class LoadFromFXBData : public PresetTest {
 protected:
  LoadFromFXBData() {
    effect.setPrograms({{"Init", {0.0f}}, {"Other", {0.0f}}});
    effect.namesProgramsByIndex = true;
    openWithChunks();
  }
};

TEST_F(LoadFromFXBData, ReadsNothingOfDataThatIsTooShort) {
  for (const int size : {27, 0, -1, -2147483647 - 1}) EXPECT_FALSE(wrapper->loadFromFXBData(nullptr, size));
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(LoadFromFXBData, Refuses27BytesOfEveryFormAndAccepts28) {
  for (const std::string& data :
       {program("Init", {}), programChunk("Init", "", -60), bankChunk("", -160), header("FxBk", -1)}) {
    effect.forget();
    EXPECT_FALSE(loadAs(data, 27));
    EXPECT_THAT(requests(), IsEmpty());
    EXPECT_TRUE(loadAs(data, 28));
  }
}

struct Data {
  std::string name;
  std::string bytes;
};

class LoadRefuses : public LoadFromFXBData, public testing::WithParamInterface<Data> {};

TEST_P(LoadRefuses, WithoutARequest) {
  EXPECT_FALSE(load(GetParam().bytes));
  EXPECT_THAT(requests(), IsEmpty());
}

const std::string kProgramData = program("New", {kHalf});
const std::string kProgramChunkData = programChunk("New", "chunk");
const std::string kBankChunkData = bankChunk("bank");
const std::string kBankData = preset_bytes::bank({kProgramData, kProgramData});

INSTANTIATE_TEST_SUITE_P(
    Data, LoadRefuses,
    testing::Values(
        Data{"AChunkMagicInLowerCase", with(kProgramData, 0, "ccnk")},
        Data{"AChunkMagicThatIsTheFormMagic", with(kProgramData, 0, "FxCk")},
        Data{"AHalfReversedChunkMagic", with(kProgramData, 0, "nKCc")},
        Data{"Version2OfAProgram", with(kProgramData, 12, word(2))},
        Data{"Version2OfAProgramChunk", with(kProgramChunkData, 12, word(2))},
        Data{"Version2OfABankChunk", with(kBankChunkData, 12, word(2))},
        Data{"Version2OfABankWithANegativeCount", header("FxBk", -1, 2)},
        Data{"TheLargestVersion", with(kProgramData, 12, word(2147483647))},
        Data{"AProgramBehindTheReversedChunkMagic", with(kProgramData, 0, "KncC")},
        Data{"AReversedProgram", with(kProgramData, 8, "kCxF")},
        Data{"AReversedProgramBehindTheReversedChunkMagic", with(with(kProgramData, 0, "KncC"), 8, "kCxF")},
        Data{"AReversedBank", with(kBankData, 8, "kBxF")},
        Data{"AReversedBankBehindTheReversedChunkMagic", with(with(kBankData, 0, "KncC"), 8, "kBxF")},
        Data{"AnUnknownForm", with(kProgramData, 8, "FxXk")},
        Data{"AProgramChunkWithOneByteTooMany", programChunk("New", "chunk", 6)},
        Data{"AProgramChunkOfTheLargestSize", programChunk("New", "chunk", 2147483647)},
        Data{"AReversedProgramChunkWithOneByteTooMany", with(programChunk("New", "chunk", 6), 8, "hCPF")},
        Data{"AnEmptyProgramChunkOneByteShort", programChunk("New", "").substr(0, 59)},
        Data{"ABankChunkWithOneByteTooMany", bankChunk("bank", 5)},
        Data{"ABankChunkOfTheLargestSize", bankChunk("bank", 2147483647)},
        Data{"AReversedBankChunkWithOneByteTooMany", with(bankChunk("bank", 5), 8, "hCBF")},
        Data{"AnEmptyBankChunkOneByteShort", bankChunk("").substr(0, 159)}),
    host_tests::nameOfCase<Data>);

struct Accepted {
  std::string name;
  std::string bytes;
  Requests expected;
};

class LoadAccepts : public LoadFromFXBData, public testing::WithParamInterface<Accepted> {};

TEST_P(LoadAccepts, AndPassesItOn) {
  EXPECT_TRUE(load(GetParam().bytes));
  EXPECT_EQ(requests(), GetParam().expected);
}

const Requests kTakesProgram = inOrder({renames("New"), sets(0, 0.5f)});
const Requests kTakesProgramChunk = inOrder({{doubles::setChunk(1, "chunk")}, renames("New")});
const Requests kTakesBankChunk = {doubles::setChunk(0, "bank"), doubles::programNameIndexed(0)};

// The numbers inside are big-endian behind a reversed magic too.
INSTANTIATE_TEST_SUITE_P(
    Data, LoadAccepts,
    testing::Values(
        Accepted{"Version0", with(kProgramData, 12, word(0)), kTakesProgram},
        Accepted{"TheSmallestVersion", with(kProgramData, 12, word(-2147483648)), kTakesProgram},
        Accepted{"VersionMinus1OfAChunk", with(kProgramChunkData, 12, word(-1)), kTakesProgramChunk},
        Accepted{"AProgramChunkThatFitsExactly", kProgramChunkData, kTakesProgramChunk},
        Accepted{"AReversedProgramChunk", with(kProgramChunkData, 8, "hCPF"), kTakesProgramChunk},
        Accepted{"AProgramChunkBehindTheReversedChunkMagic", with(kProgramChunkData, 0, "KncC"),
                 kTakesProgramChunk},
        Accepted{"ABankChunkThatFitsExactly", kBankChunkData, kTakesBankChunk},
        Accepted{"AReversedBankChunkBehindTheReversedChunkMagic",
                 with(with(kBankChunkData, 0, "KncC"), 8, "hCBF"), kTakesBankChunk},
        Accepted{"PartOfAProgramChunk", programChunk("New", "chunk and more", 5), kTakesProgramChunk},
        Accepted{"PartOfABankChunk", bankChunk("bank and more", 4), kTakesBankChunk},
        Accepted{"AnEmptyProgramChunk", programChunk("New", ""), renames("New")},
        Accepted{"TheMostNegativeProgramChunk", programChunk("New", "chunk", -2147483648), renames("New")},
        Accepted{"AnEmptyBankChunk", bankChunk(""), {}},
        Accepted{"TheMostNegativeBankChunk", bankChunk("bank", -2147483648), {}}),
    host_tests::nameOfCase<Accepted>);

}  // namespace
