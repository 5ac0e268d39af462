// SPDX-License-Identifier: MIT
#include "describer/description_json.h"

#include "describer/json_writer.h"

namespace {

using KelVSTInfoCache::ParamInfo;

constexpr int kFormatVersion = 1;

struct Name {
  VstInt32 number;
  const char* name;
};

constexpr Name kCategories[] = {
    {kPlugCategUnknown, "unknown"},
    {kPlugCategEffect, "effect"},
    {kPlugCategSynth, "synth"},
    {kPlugCategAnalysis, "analysis"},
    {kPlugCategMastering, "mastering"},
    {kPlugCategSpacializer, "spatializer"},
    {kPlugCategRoomFx, "room effect"},
    {kPlugSurroundFx, "surround effect"},
    {kPlugCategRestoration, "restoration"},
    {kPlugCategOfflineProcess, "offline process"},
    {kPlugCategShell, "shell"},
    {kPlugCategGenerator, "generator"},
};

constexpr Name kFlags[] = {
    {effFlagsHasEditor, "has editor"},
    {effFlagsCanReplacing, "can replace"},
    {effFlagsProgramChunks, "program chunks"},
    {effFlagsIsSynth, "is synth"},
    {effFlagsNoSoundInStop, "no sound in stop"},
    {effFlagsCanDoubleReplacing, "can replace in double precision"},
};

constexpr Name kSurroundModels[] = {
    {kKelSurroundMonoStereo, "mono or stereo"},
    {kKelSurroundQuad, "quad"},
    {kKelSurroundLCRS, "LCRS"},
    {kKelSurround51, "5.1"},
    {kKelSurround61, "6.1"},
    {kKelSurround71, "7.1"},
    {kKelSurround102, "10.2"},
};

void member(JsonWriter& json, const char* key, const std::string& value) {
  json.key(key);
  json.text(value);
}

void member(JsonWriter& json, const char* key, VstInt32 value) {
  json.key(key);
  json.integer(value);
}

void flag(JsonWriter& json, const char* key, bool value) {
  json.key(key);
  json.boolean(value);
}

template <std::size_t count>
const char* nameOf(VstInt32 number, const Name (&names)[count]) {
  for (const Name& row : names) {
    if (row.number == number) return row.name;
  }
  return nullptr;
}

void textOrNull(JsonWriter& json, const char* text) {
  if (text == nullptr) {
    json.null();
  } else {
    json.text(text);
  }
}

/// The four characters of an identifier that was made of such, as most are; null where one is not printable.
void fourCharacters(JsonWriter& json, VstInt32 id) {
  const auto bits = static_cast<std::uint32_t>(id);
  char text[5] = {};
  for (unsigned i = 0; i < 4; ++i) {
    const std::uint32_t byte = bits >> (24 - 8 * i) & 0xFF;
    if (byte < 0x20 || byte > 0x7E) {
      json.null();
      return;
    }
    text[i] = static_cast<char>(byte);
  }
  json.text(text);
}

void uniqueId(JsonWriter& json, VstInt32 id) {
  json.beginObject();
  member(json, "number", id);
  json.key("text");
  fourCharacters(json, id);
  json.endObject();
}

void category(JsonWriter& json, VstInt32 number) {
  json.beginObject();
  member(json, "number", number);
  json.key("name");
  textOrNull(json, nameOf(number, kCategories));
  json.endObject();
}

void flags(JsonWriter& json, VstInt32 bits) {
  json.beginObject();
  member(json, "number", bits);
  json.key("names");
  json.beginArray();
  for (const Name& row : kFlags) {
    if ((bits & row.number) != 0) json.text(row.name);
  }
  json.endArray();
  json.endObject();
}

void pins(JsonWriter& json, const std::vector<std::optional<PinDescription>>& all) {
  json.beginArray();
  for (const std::optional<PinDescription>& pin : all) {
    if (!pin) {
      json.null();
      continue;
    }
    json.beginObject();
    member(json, "label", pin->label);
    member(json, "shortLabel", pin->shortLabel);
    flag(json, "isActive", (pin->flags & kVstPinIsActive) != 0);
    flag(json, "isStereo", (pin->flags & kVstPinIsStereo) != 0);
    json.key("speakerArrangement");
    if (pin->speakerArrangement) {
      json.integer(*pin->speakerArrangement);
    } else {
      json.null();
    }
    json.endObject();
  }
  json.endArray();
}

void programs(JsonWriter& json, const std::vector<std::optional<std::string>>& names) {
  json.beginArray();
  for (const std::optional<std::string>& name : names) {
    if (name) {
      json.text(*name);
    } else {
      json.null();
    }
  }
  json.endArray();
}

void parameterCategory(JsonWriter& json, const VstParameterProperties& props) {
  if ((props.flags & kVstParameterSupportsDisplayCategory) == 0) {
    json.null();
    return;
  }
  json.beginObject();
  member(json, "number", props.category);
  member(json, "name", std::string(props.categoryLabel));
  json.endObject();
}

void parameter(JsonWriter& json, const ParamInfo& info, const std::string& valueText) {
  json.beginObject();
  member(json, "name", info.paramName.text);
  member(json, "shortName", std::string(info.props.shortLabel));
  member(json, "label", info.paramLabel.text);
  json.key("value");
  json.real(static_cast<float>(info.currentValue));
  member(json, "valueText", valueText);
  json.key("minimum");
  json.integer(static_cast<std::int64_t>(info.minValue));
  json.key("maximum");
  json.integer(static_cast<std::int64_t>(info.maxValue));
  flag(json, "isAutomatable", info.automatable);
  flag(json, "isSwitch", (info.props.flags & kVstParameterIsSwitch) != 0);
  flag(json, "canRamp", (info.props.flags & kVstParameterCanRamp) != 0);
  json.key("category");
  parameterCategory(json, info.props);
  json.key("stepTexts");
  json.beginArray();
  for (const std::string& text : info.valueTexts) json.text(text);
  json.endArray();
  json.endObject();
}

void variant(JsonWriter& json, const VSTVariant& v) {
  json.beginObject();
  member(json, "id", v.variantID);
  member(json, "inputs", v.numIns);
  member(json, "outputs", v.numOuts);
  json.key("surroundModel");
  textOrNull(json, nameOf(v.surroundModel, kSurroundModels));
  json.endObject();
}

}  // namespace

std::string descriptionAsJson(const PluginDescription& description) {
  const KelVSTInfoCache::VSTInfo& info = description.info;
  JsonWriter json;
  json.beginObject();
  member(json, "format", "vsttorture plug-in description");
  member(json, "formatVersion", kFormatVersion);
  member(json, "bundle", description.identity.path);
  json.key("childId");
  if (description.identity.child.hasChildID) {
    json.integer(description.identity.child.childID);
  } else {
    json.null();
  }
  member(json, "name", info.effectName);
  member(json, "maker", info.vendorName);
  json.key("product");
  if (description.product) {
    json.text(*description.product);
  } else {
    json.null();
  }
  json.key("uniqueId");
  uniqueId(json, info.uniqueID);
  member(json, "version", description.version);
  member(json, "vendorVersion", description.vendorVersion);
  member(json, "vstVersion", info.vstVersion);
  json.key("category");
  category(json, description.category);
  flag(json, "isShell", info.isShell);
  flag(json, "isSynth", info.isSynth);
  flag(json, "receivesMidi", info.receivesMidi);
  flag(json, "sendsMidi", info.sendsMidi);
  flag(json, "hasEditor", info.hasEditor);
  flag(json, "hasChunks", (description.flags & effFlagsProgramChunks) != 0);
  json.key("flags");
  flags(json, description.flags);
  member(json, "latencyInSamples", description.latencyInSamples);
  json.key("inputs");
  pins(json, description.inputs);
  json.key("outputs");
  pins(json, description.outputs);
  json.key("currentProgram");
  if (description.programs.empty()) {
    json.null();
  } else {
    json.integer(description.currentProgram);
  }
  json.key("programs");
  programs(json, description.programs);
  json.key("parameters");
  json.beginArray();
  for (std::size_t i = 0; i < info.params.size(); ++i) {
    parameter(json, info.params[i], description.valueTexts[i]);
  }
  json.endArray();
  json.key("children");
  json.beginArray();
  for (const VST_ChildSpec& child : info.childIDs) {
    json.beginObject();
    member(json, "id", child.childID);
    member(json, "name", child.childName);
    json.endObject();
  }
  json.endArray();
  json.key("variants");
  json.beginArray();
  for (const VSTVariant& v : info.variants) variant(json, v);
  json.endArray();
  json.key("latin1");
  const std::vector<std::string> latin1 = json.latin1Texts();
  json.beginArray();
  for (const std::string& pointer : latin1) json.text(pointer);
  json.endArray();
  json.endObject();
  return json.document() + "\n";
}
