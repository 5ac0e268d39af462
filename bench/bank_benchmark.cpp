// SPDX-License-Identifier: MIT
// The time that saving and loading a bank takes for each parameter of each program, in process, on the null
// plug-in. `per_value` is that time in seconds. For comparison, askAndWriteOnly() measures a loop over the
// values.
#include <cstdlib>
#include <memory>
#include <string>

#include <benchmark/benchmark.h>

#include "host/preset_format.h"
#include "host/vst_wrapper.h"

namespace {

using benchmark::Counter;

/// An instance of the null plug-in with as many parameters and programs as the benchmark's arguments say.
std::unique_ptr<VSTWrapper> makeInstance(const benchmark::State& state) {
  setenv("NULL_PLUGIN_PARAMETERS", std::to_string(state.range(0)).c_str(), 1);
  setenv("NULL_PLUGIN_PROGRAMS", std::to_string(state.range(1)).c_str(), 1);
  const VST_DLL_Info identity(NULL_PLUGIN, "bench");
  std::unique_ptr<VSTWrapper> wrapper(
      VSTWrapper::New(VSTPluginLoader::demandLoadedPlugin(identity), VST_ChildSpec(), nullptr));
  if (wrapper == nullptr) std::abort();
  return wrapper;
}

void countValues(benchmark::State& state) {
  const auto values = static_cast<double>(state.range(0) * state.range(1));
  state.counters["per_value"] = Counter(values, Counter::kIsIterationInvariantRate | Counter::kInvert);
}

void saveBank(benchmark::State& state) {
  const std::unique_ptr<VSTWrapper> wrapper = makeInstance(state);
  for ([[maybe_unused]] auto _ : state) {
    AutoBuffer<char> bank;
    wrapper->saveToFXBData(bank, true);
    benchmark::DoNotOptimize(bank.data());
  }
  countValues(state);
}

void loadBank(benchmark::State& state) {
  const std::unique_ptr<VSTWrapper> wrapper = makeInstance(state);
  AutoBuffer<char> bank;
  wrapper->saveToFXBData(bank, true);
  for ([[maybe_unused]] auto _ : state) {
    if (!wrapper->loadFromFXBData(bank.data(), bank.size())) std::abort();
  }
  countValues(state);
}

/// The work that no host can avoid: asks for each value and writes it in the format's byte order.
void askAndWriteOnly(benchmark::State& state) {
  const std::unique_ptr<VSTWrapper> wrapper = makeInstance(state);
  AEffect* effect = wrapper->effect;
  AutoBuffer<char> block;
  block.setSize(static_cast<int>(state.range(0)) * 4);
  for ([[maybe_unused]] auto _ : state) {
    for (std::int64_t program = 0; program < state.range(1); ++program) {
      char* at = block.data();
      for (VstInt32 i = 0; i < effect->numParams; ++i, at += 4)
        writeFloat(at, effect->getParameter(effect, i));
    }
    benchmark::ClobberMemory();
  }
  countValues(state);
}

void sizes(benchmark::internal::Benchmark* benchmark) {
  benchmark->ArgNames({"parameters", "programs"})->Args({100, 100})->Args({1000, 100})->Args({1000, 1000});
}

BENCHMARK(saveBank)->Apply(sizes);
BENCHMARK(loadBank)->Apply(sizes);
BENCHMARK(askAndWriteOnly)->Apply(sizes);

}  // namespace

BENCHMARK_MAIN();
