// SPDX-License-Identifier: MIT
// How the recording CoreFoundation keeps its objects and its record.
#include "tests/shared/core_foundation_world.h"

#include <deque>

namespace doubles {
namespace {

// Every object of every test.
std::deque<CoreFoundationObject>& allObjects() {
  static auto& objects = *new std::deque<CoreFoundationObject>;
  return objects;
}

const char* nameOf(CoreFoundationObject::Kind kind) {
  switch (kind) {
    case CoreFoundationObject::Kind::kString:
      return "string";
    case CoreFoundationObject::Kind::kUrl:
      return "URL";
    case CoreFoundationObject::Kind::kBundle:
      return "bundle";
    case CoreFoundationObject::Kind::kLocale:
      return "locale";
  }
  return "object";
}

}  // namespace

std::string described(const CoreFoundationObject* object) {
  return object == nullptr ? "null" : std::string(nameOf(object->kind)) + " \"" + object->text + '"';
}

void CoreFoundationWorld::record(const std::string& function, const std::string& arguments,
                                 const std::string& answer) {
  calls.emplace_back(function, function + "(" + arguments + ")" + (answer.empty() ? "" : " -> " + answer));
}

CoreFoundationObject* CoreFoundationWorld::make(Kind kind, const std::string& text) {
  CoreFoundationObject object;
  object.kind = kind;
  object.text = text;
  allObjects().push_back(object);
  made.push_back(&allObjects().back());
  return &allObjects().back();
}

CoreFoundationObject* CoreFoundationWorld::use(const char* function, CFTypeRef reference,
                                               std::optional<Kind> kind) {
  auto* const object = static_cast<CoreFoundationObject*>(const_cast<void*>(reference));
  const char* problem = nullptr;
  if (object == nullptr) {
    problem = " of ";
  } else if (object->references <= 0) {
    problem = " of a released ";
  } else if (kind && object->kind != *kind) {
    problem = " of a ";
  }
  if (problem == nullptr) return object;
  misuses.push_back(function + (problem + described(object)));
  return nullptr;
}

}  // namespace doubles
