#include <stdexcept>
#include <utility>

#include "engine/ml/json_value.h"

namespace ml {

namespace {

constexpr char kEmptyStack[] = "json parsing error, trying to set value on empty stack";
constexpr char kNotAKey[] = "json parse error, only string supported to append into hash";

}  // namespace

Composer::Composer() { stack_.push_back(&root_); }

JsonValue& Composer::Top() {
  if (stack_.empty()) throw std::runtime_error(kEmptyStack);
  return *stack_.back();
}

void Composer::Deliver(JsonValue value) {
  JsonValue& top = Top();
  if (auto* array = boost::get<JsonArray>(&top)) {
    array->push_back(std::move(value));
    return;
  }
  if (auto* object = boost::get<JsonObject>(&top)) {
    auto* key = boost::get<std::string>(&value);
    if (key == nullptr) throw std::runtime_error(kNotAKey);
    JsonValue& slot = (*object)[std::move(*key)];
    // Filling an earlier container again would append into it and leave the stack one
    // level off for the rest of the document.
    const JsonKind kind = KindOf(slot);
    if (kind == JsonKind::kObject || kind == JsonKind::kArray) throw Rejected{};
    stack_.push_back(&slot);
    return;
  }
  top = std::move(value);
  stack_.pop_back();
}

void Composer::OpenContainer(JsonValue empty) {
  JsonValue& top = Top();
  if (open_ == kMaxJsonDepth) {
    throw std::runtime_error("JSON: nesting deeper than " + std::to_string(kMaxJsonDepth) +
                             " levels");
  }
  ++open_;
  if (auto* array = boost::get<JsonArray>(&top)) {
    array->push_back(std::move(empty));
    stack_.push_back(&array->back());
    return;
  }
  top = std::move(empty);  // the slot stays on the stack as the open container
}

void Composer::ObjectStart() { OpenContainer(JsonObject{}); }
void Composer::ArrayStart() { OpenContainer(JsonArray{}); }

void Composer::ContainerEnd() {
  if (stack_.empty()) throw std::runtime_error(kEmptyStack);
  stack_.pop_back();
  if (open_ > 0) --open_;
}

void Composer::StringStart() { text_.clear(); }
void Composer::StringChar(char c) { text_.push_back(c); }

void Composer::StringEscaped(char c) {
  switch (c) {
    case 'b':
      c = '\b';
      break;
    case 'f':
      c = '\f';
      break;
    case 'n':
      c = '\n';
      break;
    case 'r':
      c = '\r';
      break;
    case 't':
      c = '\t';
      break;
    default:
      break;  // any other character stands for itself
  }
  text_.push_back(c);
}

void Composer::StringEnd() { Deliver(JsonValue(text_)); }
void Composer::Integer(std::int64_t value) { Deliver(JsonValue(value)); }
void Composer::Double(double value) { Deliver(JsonValue(value)); }
void Composer::Null() { Deliver(JsonValue(boost::blank{})); }
void Composer::Bool(bool value) { Deliver(JsonValue(value)); }

JsonValue Composer::TakeRoot() { return std::move(root_); }

}  // namespace ml
