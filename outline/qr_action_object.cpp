// Action tables and the performing of action strings.
#include "outline/qr_action_object.h"

#include <string>

QR_CompiledActions::QR_CompiledActions(const QR_ActionSpec* specs, std::uint32_t count) {
  entries_.reserve(count);
  for (std::uint32_t i = 0; i < count; ++i) {
    if (specs[i].name == nullptr || specs[i].operation == nullptr) continue;
    entries_.push_back(Entry{QR_ActionAtom(specs[i].name), specs[i].operation});
  }
}

const QR_CompiledActions::Entry* QR_CompiledActions::find(XrmQuark atom) const {
  for (const Entry& e : entries_) {
    if (e.atom == atom) return &e;
  }
  return nullptr;
}

static bool isBlank(char c) { return c == ' ' || c == '\t'; }

XrmQuark QR_ActionAtom(std::string_view name) {
  while (!name.empty() && isBlank(name.front())) name.remove_prefix(1);
  while (!name.empty() && isBlank(name.back())) name.remove_suffix(1);
  std::string copy(name);
  return XrmStringToQuark(copy.c_str());
}

std::vector<std::string_view> QR_SplitActionNames(std::string_view names) {
  std::vector<std::string_view> out;
  if (names.find(',') == std::string_view::npos) {
    // A single name keeps inner blanks; only the blanks around it are skipped.
    while (!names.empty() && isBlank(names.front())) names.remove_prefix(1);
    while (!names.empty() && isBlank(names.back())) names.remove_suffix(1);
    if (!names.empty()) out.push_back(names);
    return out;
  }
  std::size_t i = 0;
  while (i < names.size()) {
    while (i < names.size() && (names[i] == ',' || isBlank(names[i]))) ++i;
    std::size_t start = i;
    while (i < names.size() && names[i] != ',' && !isBlank(names[i])) ++i;
    if (i > start) out.push_back(names.substr(start, i - start));
  }
  return out;
}

QR_ActionObject::~QR_ActionObject() = default;

const QR_CompiledActions::Entry* QR_ActionObject::find_entry(XrmQuark atom) const {
  if (!tables_) return nullptr;
  for (QR_CompiledActions* table : *tables_) {
    if (const QR_CompiledActions::Entry* e = table->find(atom)) return e;
  }
  return nullptr;
}

bool QR_ActionObject::perform_one(std::string_view name, void* argument, const QR_ObjectWatch& self) {
  const QR_CompiledActions::Entry* entry = find_entry(QR_ActionAtom(name));
  if (entry == nullptr) return false;
  std::string text(name);
  before_action(text.c_str());
  entry->operation(*this, argument);
  if (!self.gone(this)) after_action(text.c_str());
  return true;
}

bool QR_ActionObject::perform_action(const char* names, void* argument) {
  if (names == nullptr) return false;
  bool performed = false;
  // The names are copied first: an action may change what the caller's string points at.
  std::string copy(names);
  QR_ObjectWatch self;
  self.watch(this);
  for (std::string_view name : QR_SplitActionNames(copy)) {
    if (perform_one(name, argument, self)) performed = true;
    if (self.gone(this)) break;
  }
  return performed;
}

bool QR_ActionObject::has_action(const char* names) {
  if (names == nullptr) return false;
  for (std::string_view name : QR_SplitActionNames(names)) {
    if (find_entry(QR_ActionAtom(name)) != nullptr) return true;
  }
  return false;
}

void QR_ActionObject::after_action(const char*) {}
void QR_ActionObject::before_action(const char*) {}

void QR_ActionObject::attach_actions(QR_CompiledActions* table) {
  if (table == nullptr) return;
  if (!tables_) tables_ = std::make_unique<QR_PointerArray<QR_CompiledActions>>();
  if (!tables_->contains(table)) tables_->append(table);
}

void QR_ActionObject::detach_actions(QR_CompiledActions* table) {
  if (tables_) tables_->remove(table);
}

bool QR_ActionObject::has_actions_table(const QR_CompiledActions* table) const {
  return tables_ && tables_->contains(table);
}

bool QR_ActionObject::has_action_atom(XrmQuark atom) const { return find_entry(atom) != nullptr; }
