// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData: programs with a chunk.
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::setChunk;
using preset_bytes::programChunk;

class LoadProgramChunk : public PresetTest {};

TEST_F(LoadProgramChunk, GivesTheChunkAndThenTheName) {
  effect.setPrograms({{"Init", {0.0f}}, {"B", {}}});
  openWithChunks();
  EXPECT_TRUE(load(programChunk("New", std::string("c\0d", 3)), 0));
  EXPECT_EQ(requests(), inOrder({{setChunk(1, std::string("c\0d", 3))}, renames("New")}));
}

TEST_F(LoadProgramChunk, OfItsOwnMakingBringsTheStateBack) {
  effect.setPrograms({{"Init", {}}});
  effect.programChunk = "state";
  openWithChunks();
  const std::string saved = save(kProgram);
  effect.programChunk = "other";
  effect.setPrograms({{"Other", {}}});
  EXPECT_TRUE(load(saved, 0));
  EXPECT_EQ(effect.programChunk, "state");
  EXPECT_EQ(effect.program(0).name, "Init");
}

// On purpose: accepted, although nothing is passed on.
TEST_F(LoadProgramChunk, IsAcceptedByAPluginWithoutChunks) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(load(programChunk("Init", "chunk")));
  EXPECT_EQ(requests(), keepsName());
  effect.forget();
  EXPECT_TRUE(load(programChunk("New", "chunk")));
  EXPECT_EQ(requests(), renames("New"));
}

TEST_F(LoadProgramChunk, GivesOnlyTheBytesThatTheSizeFieldClaims) {
  effect.setPrograms({{"Init", {}}});
  openWithChunks();
  EXPECT_TRUE(load(programChunk("Init", "chunk and more", 5)));
  EXPECT_EQ(requests(), inOrder({{setChunk(1, "chunk")}, keepsName()}));
}

}  // namespace
