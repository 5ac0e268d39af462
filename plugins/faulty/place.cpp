// SPDX-License-Identifier: MIT
// Where a fault happens.
#include "plugins/faulty/place.h"

#include <array>
#include <optional>
#include <string>
#include <utility>

#include "plugins/faulty/faults.h"
#include "plugins/faulty/settings.h"

namespace sample_plugins {
namespace {

struct Place {
  Moment moment;
  VstInt32 opcode;
  int turn;  ///< Counts from 1.
};

constexpr std::array<std::pair<const char*, Moment>, 5> kMoments = {{
    {"load", Moment::load},
    {"entry", Moment::entry},
    {"dispatch", Moment::dispatch},
    {"getParameter", Moment::getParameter},
    {"setParameter", Moment::setParameter},
}};

/// Takes ":NUMBER" off the front of the text.
std::optional<int> takeNumber(std::string& text) {
  if (text.empty() || text.front() != ':') return std::nullopt;
  std::size_t used = 0;
  try {
    const int number = std::stoi(text.substr(1), &used);
    text.erase(0, 1 + used);
    return number;
  } catch (const std::exception&) {
    return std::nullopt;
  }
}

Place parsePlace(const std::string& text) {
  for (const auto& [name, moment] : kMoments) {
    std::string rest = text;
    if (rest.compare(0, std::string(name).size(), name) != 0) continue;
    rest.erase(0, std::string(name).size());
    Place place{moment, 0, 1};
    if (moment == Moment::dispatch) {
      const std::optional<int> opcode = takeNumber(rest);
      if (!opcode) break;
      place.opcode = *opcode;
    }
    if (!rest.empty()) place.turn = takeNumber(rest).value_or(0);
    if (rest.empty() && place.turn > 0) return place;
  }
  complain("no such place: " + text);
}

/// Nothing when no fault is wanted.
const std::optional<Place>& wantedPlace() {
  static const std::string& text = faultSettings().place;
  static const std::optional<Place> place = text.empty() ? std::nullopt : std::optional(parsePlace(text));
  return place;
}

}  // namespace

bool waitsForSetParameter() { return wantedPlace() && wantedPlace()->moment == Moment::setParameter; }

bool waitsForRequest(VstInt32 opcode) {
  return wantedPlace() && wantedPlace()->moment == Moment::dispatch && wantedPlace()->opcode == opcode;
}

void reach(Moment moment, VstInt32 opcode) {
  if (!wantedPlace()) return;
  if (moment == Moment::load) commitFaults(true);
  const Place& wanted = *wantedPlace();
  static int turn = 0;
  if (moment == wanted.moment && opcode == wanted.opcode && ++turn == wanted.turn) commitFaults(false);
}

}  // namespace sample_plugins
