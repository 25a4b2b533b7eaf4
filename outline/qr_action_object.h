// Named actions: shared tables of compiled action names and the objects that perform them.
#pragma once

#include <X11/Xresource.h>

#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "outline/qr_object.h"
#include "outline/qr_pointer_array.h"

class QR_ActionObject;

// The operation behind an action: called on the object the action is performed on.
using QR_ActionOperation = void (*)(QR_ActionObject& object, void* argument);

// One (name, operation) pair of a static action table.
struct QR_ActionSpec {
  const char* name;
  QR_ActionOperation operation;
};

// Adapts a member operation of a row class to an action table entry; an object of another
// class than the table was written for is left alone.
template <class Row, void (Row::*Operation)()>
void QR_ActionCall(QR_ActionObject& object, void*) {
  if (Row* row = dynamic_cast<Row*>(&object)) (row->*Operation)();
}
template <class Row, void (Row::*Operation)(void*)>
void QR_ActionCallWithArgument(QR_ActionObject& object, void* argument) {
  if (Row* row = dynamic_cast<Row*>(&object)) (row->*Operation)(argument);
}

// A shared table of actions, each name turned once into an atom.
class QR_CompiledActions : public QR_Object {
 public:
  struct Entry {
    XrmQuark atom;
    QR_ActionOperation operation;
  };

  QR_CompiledActions(const QR_ActionSpec* specs, std::uint32_t count);

  std::uint32_t count() const { return static_cast<std::uint32_t>(entries_.size()); }
  const Entry* find(XrmQuark atom) const;
  const std::vector<Entry>& entries() const { return entries_; }

 private:
  std::vector<Entry> entries_;
};

// The atom of an action name; blanks and tabs around the name do not count.
XrmQuark QR_ActionAtom(std::string_view name);

// Splits an action string into its names: commas, blanks and tabs separate them, empty names
// are skipped.
std::vector<std::string_view> QR_SplitActionNames(std::string_view names);

class QR_ActionObject : public QR_Object {
 public:
  ~QR_ActionObject() override;

  // Performs each name of the action string in order; true when any was performed.
  virtual bool perform_action(const char* names, void* argument);
  // True when any name of the action string is held by an attached table.
  virtual bool has_action(const char* names);
  virtual void after_action(const char* name);
  virtual void before_action(const char* name);

  // Tables are referenced, never copied; attaching one already attached does nothing.
  void attach_actions(QR_CompiledActions* table);
  void detach_actions(QR_CompiledActions* table);
  bool has_actions_table(const QR_CompiledActions* table) const;
  bool has_action_atom(XrmQuark atom) const;
  const QR_PointerArray<QR_CompiledActions>* action_tables() const { return tables_.get(); }

 protected:
  // One name: searched in the attached tables in attachment order. The watch tells whether the
  // action destroyed this object, in which case nothing more is done with it.
  bool perform_one(std::string_view name, void* argument, const QR_ObjectWatch& self);

 private:
  const QR_CompiledActions::Entry* find_entry(XrmQuark atom) const;

  std::unique_ptr<QR_PointerArray<QR_CompiledActions>> tables_;  // created on first use
};
