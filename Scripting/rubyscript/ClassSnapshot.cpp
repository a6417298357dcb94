// SPDX-License-Identifier: MIT
#include "ClassSnapshot.h"

#include <stdlib.h>
#include <string.h>

#include "RubyCall.h"
#include "RubyInternals.h"

namespace {

using cruby::ClassOf;
using cruby::ConstantEntry;
using cruby::MethodEntry;

// Grows by CRuby's allocator, which raises NoMemoryError when a collection does not help.
template <class T>
struct List {
  T* items;
  int count, room;

  T* begin() const { return items; }
  T* end() const { return items + count; }
  T& Add(const T& item) {
    if (count == room) {
      const int wanted = room ? 2 * room : 4;
      items = static_cast<T*>(xrealloc2(items, static_cast<size_t>(wanted), sizeof(T)));
      room = wanted;
    }
    return items[count++] = item;
  }
  void Remove(T* item) { *item = items[--count]; }
};

bool Contains(const List<VALUE>& list, VALUE value) {
  for (const VALUE each : list)
    if (each == value) return true;
  return false;
}

struct Method {
  ID name;
  MethodEntry* entry;
  VALUE visibility;
  bool seen;
};

struct Constant {
  ID name;
  ConstantEntry entry;
  bool seen;
};

// What a class or module has when no macro has changed it.
struct Baseline {
  VALUE module;
  List<Method> methods;
  List<Constant> constants;
  List<VALUE> chain;   // of included and prepended modules, and where methods are then
  List<ID> variables;  // of the class or module itself
  long variableCount;  // with hidden ones
  bool frozen;
  bool keepsVariables;  // those that come later stay
  bool outdated;
};

// An object that has no singleton class at first.
struct Single {
  VALUE object;
  bool frozen;
};

// Of a baseline. `entry` is what there is now.
struct Change {
  enum class Kind { kMethod, kConstant, kAutoload, kChain, kVariable, kFrozen };
  Kind kind;
  VALUE module;
  ID name;
  bool present;
  VALUE value;  // MethodEntry, constant's value, path, hidden array of the chain, variable's value
  VALUE visibility;  // of a method
  ConstantEntry constant;
};

List<Baseline> baselines;
List<Single> singles;
st_table* places;      // module => index in `baselines`
VALUE keeper = Qnil;   // marks the lists above
VALUE inPlace = Qnil;  // the context whose changes are
VALUE libraryFolder = Qnil;
unsigned long long constantState;  // when all constants were as in the baselines

// --- Collector -----------------------------------------------------------------------------------

void MarkBaselines(void*) {
  for (const Baseline& baseline : baselines) {
    rb_gc_mark(baseline.module);
    for (const Method& method : baseline.methods) rb_gc_mark(reinterpret_cast<VALUE>(method.entry));
    for (const Constant& constant : baseline.constants) {
      rb_gc_mark(constant.entry.value);
      rb_gc_mark(constant.entry.file);
    }
    for (const VALUE each : baseline.chain) rb_gc_mark(each);
  }
  for (const Single& single : singles) rb_gc_mark(single.object);
}

const rb_data_type_t kKeeperType = {
    "baselines", {MarkBaselines, nullptr, nullptr, nullptr, {}}, nullptr, nullptr, 0};

using Changes = List<Change>;

void MarkChanges(void* data) {
  for (const Change& change : *static_cast<Changes*>(data)) {
    rb_gc_mark(change.module);
    rb_gc_mark(change.value);
    rb_gc_mark(change.constant.file);
  }
}

void FreeChanges(void* data) {
  xfree(static_cast<Changes*>(data)->items);
  free(data);
}

const rb_data_type_t kChangesType = {"changes",
                                     {MarkChanges, FreeChanges, nullptr, nullptr, {}},
                                     nullptr,
                                     nullptr,
                                     RUBY_TYPED_FREE_IMMEDIATELY};

VALUE NewChanges() {
  void* const list = calloc(1, sizeof(Changes));
  if (!list) rb_raise(rb_eNoMemError, "failed to allocate memory");
  return TypedData_Wrap_Struct(0, &kChangesType, list);  // hidden from ObjectSpace
}

Changes& ListOf(VALUE changes) { return *static_cast<Changes*>(RTYPEDDATA_DATA(changes)); }

// --- Tables --------------------------------------------------------------------------------------

VALUE Visibility(const MethodEntry* entry) {
  return entry->flags & VALUE{RUBY_FL_USER4 | RUBY_FL_USER5};
}

// Without the refinements that shadow it; null when there is no more.
MethodEntry* Underlying(MethodEntry* entry) {
  while (entry && entry->definition && entry->definition->type == cruby::kRefined)
    entry = entry->definition->refined;
  return entry;
}

VALUE OriginOf(VALUE module) { return ClassOf(module)->extension->origin; }
rb_id_table* MethodsOf(VALUE module) { return ClassOf(OriginOf(module))->methods; }
rb_id_table* ConstantsOf(VALUE module) { return ClassOf(module)->extension->constants; }
size_t SizeOf(rb_id_table* table) { return table ? rb_id_table_size(table) : 0; }

bool IsModule(VALUE value) { return RB_TYPE_P(value, T_CLASS) || RB_TYPE_P(value, T_MODULE); }
bool IsIncluded(VALUE super) { return super && RB_BUILTIN_TYPE(super) == T_ICLASS; }
bool IsFrozen(VALUE object) { return RB_FL_ANY_RAW(object, RUBY_FL_FREEZE) != 0; }

VALUE SingletonOf(VALUE object) {
  const VALUE type = RBASIC_CLASS(object);
  return type && RB_FL_ANY_RAW(type, RUBY_FL_SINGLETON) ? type : 0;
}

template <class T>
T* Find(const List<T>& list, ID name) {
  for (T& each : list)
    if (each.name == name) return &each;
  return nullptr;
}

Baseline* BaselineOf(VALUE module) {
  st_data_t index;
  return st_lookup(places, module, &index) ? &baselines.items[index] : nullptr;
}

bool IsLibraryPath(const char* path) {
  return strncmp(path, RSTRING_PTR(libraryFolder), strlen(RSTRING_PTR(libraryFolder))) == 0;
}

bool IsLibraryPath(VALUE path) {
  return RB_TYPE_P(path, T_STRING) && RSTRING_LEN(path) && IsLibraryPath(RSTRING_PTR(path));
}

// Nil for a method in C.
VALUE PathOf(MethodEntry* entry) {
  const VALUE location = rb_method_entry_location(entry);
  return NIL_P(location) ? Qnil : rb_ary_entry(location, 0);
}

// Whether a library has defined a method of the module.
bool HasLibraryMethods(VALUE module) {
  List<VALUE> entries = {};
  const auto add = [](VALUE entry, void* data) {
    static_cast<List<VALUE>*>(data)->Add(entry);
    return static_cast<int>(ST_CONTINUE);
  };
  rb_id_table_foreach_values(MethodsOf(module), add, &entries);
  if (const VALUE singleton = SingletonOf(module))
    rb_id_table_foreach_values(MethodsOf(singleton), add, &entries);
  bool found = false;
  for (const VALUE entry : entries)
    found = found || IsLibraryPath(PathOf(reinterpret_cast<MethodEntry*>(entry)));
  xfree(entries.items);
  return found;
}

// --- Taking a baseline ---------------------------------------------------------------------------

int TakeMethod(ID name, VALUE value, void* data) {
  MethodEntry* const entry = reinterpret_cast<MethodEntry*>(value);
  static_cast<Baseline*>(data)->methods.Add({name, entry, Visibility(entry), false});
  return ST_CONTINUE;
}

int TakeConstant(ID name, VALUE value, void* data) {
  static_cast<Baseline*>(data)->constants.Add(
      {name, *reinterpret_cast<ConstantEntry*>(value), false});
  return ST_CONTINUE;
}

int TakeVariable(ID name, VALUE, st_data_t data) {
  if (rb_is_instance_id(name) || rb_is_class_id(name))
    reinterpret_cast<Baseline*>(data)->variables.Add(name);
  return ST_CONTINUE;
}

// As it is now, in the order of the tables.
void Take(Baseline& baseline) {
  const VALUE module = baseline.module;
  baseline.methods.count = baseline.constants.count = 0;
  baseline.chain.count = baseline.variables.count = 0;
  rb_id_table_foreach(MethodsOf(module), TakeMethod, &baseline);
  if (ConstantsOf(module)) rb_id_table_foreach(ConstantsOf(module), TakeConstant, &baseline);
  for (VALUE each = ClassOf(module)->super; IsIncluded(each); each = ClassOf(each)->super)
    baseline.chain.Add(each);
  baseline.variableCount = static_cast<long>(rb_ivar_count(module));
  if (baseline.variableCount) {
    rb_ivar_foreach(module, TakeVariable, reinterpret_cast<st_data_t>(&baseline));
  }
  baseline.frozen = IsFrozen(module);
  baseline.outdated = false;
}

Baseline& Track(VALUE module) {
  Baseline& baseline = baselines.Add({});
  baseline.module = module;
  st_insert(places, module, static_cast<st_data_t>(baselines.count - 1));
  return baseline;
}

int CollectModule(void* start, void* end, size_t stride, void* data) {
  for (char* at = static_cast<char*>(start); at != end; at += stride) {
    const VALUE object = reinterpret_cast<VALUE>(at);
    const int type = RB_BUILTIN_TYPE(object);
    if ((type == T_CLASS || type == T_MODULE) && RBASIC_CLASS(object))
      static_cast<List<VALUE>*>(data)->Add(object);
  }
  return 0;
}

int CollectConstant(VALUE value, void* data) {
  const VALUE constant = reinterpret_cast<ConstantEntry*>(value)->value;
  if (constant != Qundef && !RB_SPECIAL_CONST_P(constant))
    static_cast<List<VALUE>*>(data)->Add(constant);
  return ST_CONTINUE;
}

// A module of a library that has just been loaded, and those in it. What a macro has put into it is
// no part of the baseline.
void Discover(VALUE module) {
  if (!IsModule(module) || BaselineOf(module)) return;
  Take(Track(module));
  List<VALUE> inner = {};
  if (ConstantsOf(module)) rb_id_table_foreach_values(ConstantsOf(module), CollectConstant, &inner);
  const VALUE singleton = SingletonOf(module);
  if (!singleton) singles.Add({module, false});
  if (singleton && !BaselineOf(singleton)) Take(Track(singleton));
  for (const VALUE each : inner) {
    const bool known = IsModule(each) && BaselineOf(each);
    if (!known) Discover(each);
  }
  xfree(inner.items);
  Baseline& baseline = *BaselineOf(module);
  baseline.keepsVariables = true;
  for (int i = baseline.constants.count; i-- > 0;) {
    const ConstantEntry& entry = baseline.constants.items[i].entry;
    if (RB_TYPE_P(entry.file, T_STRING) && !IsLibraryPath(entry.file) &&
        !(IsModule(entry.value) && HasLibraryMethods(entry.value)))
      baseline.constants.Remove(&baseline.constants.items[i]);
  }
}

// --- Finding changes -----------------------------------------------------------------------------

struct MethodCursor {
  const Method* at;
  bool same;
};

int CompareMethod(VALUE value, void* data) {
  MethodCursor& cursor = *static_cast<MethodCursor*>(data);
  MethodEntry* const entry = reinterpret_cast<MethodEntry*>(value);
  cursor.same = entry == cursor.at->entry && Visibility(entry) == cursor.at->visibility;
  ++cursor.at;
  return cursor.same ? ST_CONTINUE : ST_STOP;
}

bool HasSameMethods(const Baseline& baseline) {
  rb_id_table* const table = MethodsOf(baseline.module);
  if (rb_id_table_size(table) != static_cast<size_t>(baseline.methods.count)) return false;
  MethodCursor cursor = {baseline.methods.items, true};
  rb_id_table_foreach_values(table, CompareMethod, &cursor);
  return cursor.same;
}

struct ConstantCursor {
  const Constant* at;
  bool same;
};

int CompareConstant(VALUE value, void* data) {
  ConstantCursor& cursor = *static_cast<ConstantCursor*>(data);
  const ConstantEntry& entry = *reinterpret_cast<ConstantEntry*>(value);
  cursor.same = entry.value == cursor.at->entry.value && entry.flag == cursor.at->entry.flag;
  ++cursor.at;
  return cursor.same ? ST_CONTINUE : ST_STOP;
}

bool HasSameConstants(const Baseline& baseline) {
  rb_id_table* const table = ConstantsOf(baseline.module);
  if (SizeOf(table) != static_cast<size_t>(baseline.constants.count)) return false;
  ConstantCursor cursor = {baseline.constants.items, true};
  if (table) rb_id_table_foreach_values(table, CompareConstant, &cursor);
  return cursor.same;
}

bool HasSameChain(const Baseline& baseline) {
  VALUE at = ClassOf(baseline.module)->super;
  for (const VALUE each : baseline.chain) {
    if (at != each) return false;
    at = ClassOf(at)->super;
  }
  return !IsIncluded(at);
}

struct Search {
  Baseline* baseline;
  Changes* changes;
  List<VALUE>* loaded;  // modules that were still to be loaded
};

Change ChangeOf(Change::Kind kind, const Baseline& baseline, ID name, VALUE value) {
  return {kind, baseline.module, name, true, value, 0, {0, 0, Qnil, Qnil}};
}

int SearchMethod(ID name, VALUE value, void* data) {
  const Search& search = *static_cast<Search*>(data);
  MethodEntry* const entry = reinterpret_cast<MethodEntry*>(value);
  MethodEntry* const now = Underlying(entry);
  Method* const known = Find(search.baseline->methods, name);
  MethodEntry* const before = known ? Underlying(known->entry) : nullptr;
  if (known) known->seen = true;
  const bool same = now && before ? now->definition == before->definition &&
                                        Visibility(entry) == known->visibility
                                  : now == before;
  if (same) {
    if (known) known->entry = entry;  // CRuby replaces entries by copies
    return ST_CONTINUE;
  }
  Change change = ChangeOf(Change::Kind::kMethod, *search.baseline, name, value);
  change.visibility = Visibility(entry);
  search.changes->Add(change);
  return ST_CONTINUE;
}

int SearchConstant(ID name, VALUE value, void* data) {
  const Search& search = *static_cast<Search*>(data);
  const ConstantEntry& entry = *reinterpret_cast<ConstantEntry*>(value);
  Constant* const known = Find(search.baseline->constants, name);
  if (known) known->seen = true;
  if (known && known->entry.value == Qundef && entry.value != Qundef) {
    known->entry = entry;
    if (IsModule(entry.value)) search.loaded->Add(entry.value);
  }
  if (!rb_is_const_id(name) ||
      (known && known->entry.value == entry.value && known->entry.flag == entry.flag))
    return ST_CONTINUE;
  Change change = ChangeOf(Change::Kind::kConstant, *search.baseline, name, entry.value);
  change.constant = entry;
  search.changes->Add(change);
  return ST_CONTINUE;
}

int SearchVariable(ID name, VALUE value, st_data_t data) {
  const Search& search = *reinterpret_cast<Search*>(data);
  if (!rb_is_instance_id(name) && !rb_is_class_id(name)) return ST_CONTINUE;
  for (const ID each : search.baseline->variables)
    if (each == name) return ST_CONTINUE;
  search.changes->Add(ChangeOf(Change::Kind::kVariable, *search.baseline, name, value));
  return ST_CONTINUE;
}

// Adds those of the list that have not been seen.
template <class T>
void SearchRemoved(const Search& search, const List<T>& list, Change::Kind kind) {
  for (T& each : list) {
    if (!each.seen) {
      Change change = ChangeOf(kind, *search.baseline, each.name, Qnil);
      change.present = false;
      search.changes->Add(change);
    }
    each.seen = false;
  }
}

void SearchChain(const Search& search) {
  const volatile VALUE chain = rb_ary_tmp_new(4);
  for (VALUE at = ClassOf(search.baseline->module)->super; IsIncluded(at); at = ClassOf(at)->super)
    rb_ary_push(chain, at);
  search.changes->Add(ChangeOf(Change::Kind::kChain, *search.baseline, 0, chain));
}

void SearchBaseline(const Search& search, bool withConstants) {
  Baseline& baseline = *search.baseline;
  const VALUE module = baseline.module;
  const int before = search.changes->count;
  void* const data = const_cast<Search*>(&search);
  if (!HasSameChain(baseline)) SearchChain(search);
  if (!HasSameMethods(baseline)) {
    baseline.outdated = true;
    rb_id_table_foreach(MethodsOf(module), SearchMethod, data);
    SearchRemoved(search, baseline.methods, Change::Kind::kMethod);
  }
  if (withConstants && !HasSameConstants(baseline)) {
    baseline.outdated = true;
    if (ConstantsOf(module)) rb_id_table_foreach(ConstantsOf(module), SearchConstant, data);
    SearchRemoved(search, baseline.constants, Change::Kind::kConstant);
  }
  if (!baseline.keepsVariables &&
      static_cast<long>(rb_ivar_count(module)) != baseline.variableCount) {
    rb_ivar_foreach(module, SearchVariable, reinterpret_cast<st_data_t>(&search));
  }
  if (IsFrozen(module) && !baseline.frozen)
    search.changes->Add(ChangeOf(Change::Kind::kFrozen, baseline, 0, Qnil));
  if (search.changes->count != before) baseline.outdated = true;
}

void SearchAll(Changes& changes) {
  for (const Single& single : singles) {
    const VALUE singleton = SingletonOf(single.object);
    if (singleton && !BaselineOf(singleton)) Track(singleton);
  }
  List<VALUE> loaded = {};
  const bool withConstants = constantState != ruby_vm_global_constant_state;
  for (Baseline& baseline : baselines)
    SearchBaseline({&baseline, &changes, &loaded}, withConstants);
  for (const VALUE each : loaded) Discover(each);
  xfree(loaded.items);
}

// --- Making changes ------------------------------------------------------------------------------

void ClearMethodCache(VALUE module, ID name) {
  rb_clear_method_cache(module, name);
  if (OriginOf(module) != module) rb_clear_method_cache(OriginOf(module), name);
}

// A copy, since CRuby may have marked the entry as invalid.
void SetMethod(VALUE module, ID name, MethodEntry* entry, VALUE visibility) {
  MethodEntry* const copy = rb_method_entry_clone(entry);
  copy->flags = (copy->flags & ~VALUE{RUBY_FL_USER4 | RUBY_FL_USER5}) | visibility;
  ClearMethodCache(module, name);
  rb_method_table_insert(OriginOf(module), MethodsOf(module), name, copy);
}

void RemoveMethod(VALUE module, ID name) {
  ClearMethodCache(module, name);
  rb_id_table_delete(MethodsOf(module), name);
}

void RemoveConstant(VALUE module, ID name) {
  if (rb_const_lookup(module, name)) rb_const_remove(module, name);
}

void SetConstant(VALUE module, ID name, const ConstantEntry& wanted) {
  RemoveConstant(module, name);
  rb_const_set(module, name, wanted.value);
  ConstantEntry* const entry = rb_const_lookup(module, name);
  entry->flag = wanted.flag;
  entry->line = wanted.line;
  RB_OBJ_WRITE(module, &entry->file, wanted.file);
}

void SetSuper(VALUE klass, VALUE super) {
  if (ClassOf(klass)->super == super) return;
  rb_class_remove_from_super_subclasses(klass);
  rb_class_subclass_add(super, klass);
  RB_OBJ_WRITE(klass, &ClassOf(klass)->super, super);
}

// CRuby moves the methods of a module into an origin when another one is prepended to it. They have
// to stay in the chain.
void AddOrigins(Baseline& baseline) {
  List<VALUE> chain = {};
  const auto add_origin = [&](VALUE module) {
    const VALUE origin = OriginOf(module);
    if (origin != module && !Contains(baseline.chain, origin)) chain.Add(origin);
  };
  add_origin(baseline.module);
  for (const VALUE each : baseline.chain) {
    chain.Add(each);
    add_origin(each);
  }
  xfree(baseline.chain.items);
  baseline.chain = chain;
}

void SetChain(VALUE module, const List<VALUE>& chain) {
  VALUE super = ClassOf(module)->super;
  while (IsIncluded(super)) super = ClassOf(super)->super;
  VALUE last = module;
  for (const VALUE each : chain) SetSuper(last, each), last = each;
  SetSuper(last, super);
}

void RemoveVariable(VALUE module, ID name) {
  if (rb_is_class_id(name)) {
    rb_mod_remove_cvar(module, ID2SYM(name));
    ++ruby_vm_global_cvar_state;
  } else {
    rb_obj_remove_instance_variable(module, ID2SYM(name));
  }
}

// Makes the baseline's state.
void Undo(const Change& change) {
  Baseline& baseline = *BaselineOf(change.module);
  if (!baseline.frozen) RB_FL_UNSET_RAW(change.module, VALUE{RUBY_FL_FREEZE});
  switch (change.kind) {
    case Change::Kind::kMethod: {
      const Method* const method = Find(baseline.methods, change.name);
      MethodEntry* const entry = method ? Underlying(method->entry) : nullptr;
      if (entry)
        SetMethod(change.module, change.name, entry, method->visibility);
      else
        RemoveMethod(change.module, change.name);
      break;
    }
    case Change::Kind::kConstant:
    case Change::Kind::kAutoload: {
      const Constant* const constant = Find(baseline.constants, change.name);
      if (constant && constant->entry.value != Qundef)
        SetConstant(change.module, change.name, constant->entry);
      else
        RemoveConstant(change.module, change.name);
      break;
    }
    case Change::Kind::kChain:
      AddOrigins(baseline);
      SetChain(change.module, baseline.chain);
      break;
    case Change::Kind::kVariable:
      RemoveVariable(change.module, change.name);
      break;
    case Change::Kind::kFrozen:
      break;
  }
}

void Redo(const Change& change) {
  switch (change.kind) {
    case Change::Kind::kMethod:
      if (change.present)
        SetMethod(change.module, change.name, reinterpret_cast<MethodEntry*>(change.value),
                  change.visibility);
      else
        RemoveMethod(change.module, change.name);
      break;
    case Change::Kind::kConstant:
      if (change.present)
        SetConstant(change.module, change.name, change.constant);
      else
        RemoveConstant(change.module, change.name);
      break;
    case Change::Kind::kAutoload:
      rb_autoload_str(change.module, change.name, change.value);
      break;
    case Change::Kind::kChain: {
      List<VALUE> chain = {};
      for (long i = 0; i < RARRAY_LEN(change.value); ++i) chain.Add(RARRAY_AREF(change.value, i));
      for (const VALUE each : BaselineOf(change.module)->chain)  // of libraries loaded since then
        if (!Contains(chain, each)) chain.Add(each);
      SetChain(change.module, chain);
      xfree(chain.items);
      break;
    }
    case Change::Kind::kVariable:
      rb_ivar_set(change.module, change.name, change.value);
      break;
    case Change::Kind::kFrozen:
      RB_FL_SET_RAW(change.module, VALUE{RUBY_FL_FREEZE});
      break;
  }
}

// Each step by itself: one that fails does not keep the others.
VALUE UndoBody(VALUE change) { return Undo(*reinterpret_cast<Change*>(change)), Qnil; }
VALUE RedoBody(VALUE change) { return Redo(*reinterpret_cast<Change*>(change)), Qnil; }

void ClearCaches(const Changes& changes) {
  for (const Change& change : changes) {
    if (change.kind != Change::Kind::kChain) continue;
    rb_clear_constant_cache();
    return rb_clear_method_cache_all();
  }
}

// --- Libraries -----------------------------------------------------------------------------------

// By the place of a definition.
bool IsLibrarys(const Change& change) {
  if (!change.present) return false;
  if (change.kind == Change::Kind::kMethod)
    return IsLibraryPath(PathOf(reinterpret_cast<MethodEntry*>(change.value)));
  return change.kind == Change::Kind::kConstant && IsLibraryPath(change.constant.file);
}

// By identity: the elements have no methods.
bool Holds(VALUE chain, VALUE element) {
  for (long i = 0; i < RARRAY_LEN(chain); ++i)
    if (RARRAY_AREF(chain, i) == element) return true;
  return false;
}

// Makes the change a part of the baseline. Of a chain, what was there `before` is a macro's.
void Adopt(const Change& change, const Changes* before) {
  Baseline& baseline = *BaselineOf(change.module);
  if (change.kind == Change::Kind::kMethod) {
    Method* const known = Find(baseline.methods, change.name);
    const Method method = {change.name, reinterpret_cast<MethodEntry*>(change.value),
                           change.visibility, false};
    if (known && change.present) *known = method;
    if (known && !change.present) baseline.methods.Remove(known);
    if (!known && change.present) baseline.methods.Add(method);
  } else if (change.kind == Change::Kind::kConstant) {
    Constant* const known = Find(baseline.constants, change.name);
    const Constant constant = {change.name, change.constant, false};
    if (known && change.present) *known = constant;
    if (known && !change.present) baseline.constants.Remove(known);
    if (!known && change.present) baseline.constants.Add(constant);
    if (change.present && change.value != Qundef) Discover(change.value);
  } else if (change.kind == Change::Kind::kChain) {
    List<VALUE> chain = {};
    for (long i = 0; i < RARRAY_LEN(change.value); ++i) {
      const VALUE each = RARRAY_AREF(change.value, i);
      bool macros = false;
      for (const Change& other : *before)
        if (other.kind == change.kind && other.module == change.module)
          macros = macros || Holds(other.value, each);
      if (!macros || Contains(baseline.chain, each)) chain.Add(each);
    }
    xfree(baseline.chain.items);
    baseline.chain = chain;
  } else if (change.kind == Change::Kind::kVariable) {
    baseline.variables.Add(change.name);
  } else {
    baseline.frozen = true;
  }
}

bool SameChain(VALUE one, VALUE other) {
  const long count = RARRAY_LEN(one);
  for (long i = 0; i < count && count == RARRAY_LEN(other); ++i)
    if (RARRAY_AREF(one, i) != RARRAY_AREF(other, i)) return false;
  return count == RARRAY_LEN(other);
}

bool IsSame(const Change& one, const Change& other) {
  return one.kind == other.kind && one.module == other.module && one.name == other.name &&
         one.present == other.present &&
         (one.kind == Change::Kind::kChain ? SameChain(one.value, other.value)
                                           : one.value == other.value);
}

bool IsAmong(const Changes& changes, const Change& change) {
  for (const Change& each : changes)
    if (IsSame(each, change)) return true;
  return false;
}

bool HasLoadedLibrary(VALUE features) {
  const long count = RARRAY_LEN(features);
  return count && IsLibraryPath(RARRAY_AREF(features, count - 1));
}

bool IsOpenModule(const Change& change) {
  return change.kind == Change::Kind::kConstant && change.present && IsModule(change.value);
}

// Adopts what a library has changed. It may have opened a module that the macro has opened before.
void AdoptSince(const Changes& before) {
  const volatile VALUE holder = NewChanges();
  Changes& after = ListOf(holder);
  SearchAll(after);
  for (const Change& change : after)
    if (!IsAmong(before, change)) Adopt(change, &before);
  for (const Change& change : before)
    if (IsOpenModule(change) && !change.visibility && HasLibraryMethods(change.value))
      Adopt(change, &before);
}

// What changes while a file of the library is loaded is the library's.
VALUE Require(VALUE self, VALUE name) {
  const char* const caller = rb_sourcefile();
  if ((caller && IsLibraryPath(caller)) ||
      (RB_TYPE_P(name, T_STRING) && rb_provided(StringValueCStr(name))))
    return rb_f_require(self, name);
  const volatile VALUE holder = NewChanges();
  Changes& before = ListOf(holder);
  SearchAll(before);
  for (Change& change : before)
    if (IsOpenModule(change)) change.visibility = HasLibraryMethods(change.value);
  const VALUE loaded = rb_f_require(self, name);
  if (loaded == Qtrue && HasLoadedLibrary(rb_gv_get("$LOADED_FEATURES"))) AdoptSince(before);
  return loaded;
}

// --- In and out ----------------------------------------------------------------------------------

// Finds the changes, keeps a library's, and undoes the others, which stay in the list.
void UndoAll(Changes& changes) {
  bool adopted = true;
  for (int tries = 0; adopted && tries < 4; ++tries) {  // a library's module may hold a macro's
    adopted = false;
    changes.count = 0;
    SearchAll(changes);
    for (const Change& change : changes) {
      if (!IsLibrarys(change)) continue;
      Adopt(change, nullptr);
      adopted = true;
    }
  }
  for (const Single& single : singles)
    if (!single.frozen && !IsModule(single.object))
      RB_FL_UNSET_RAW(single.object, VALUE{RUBY_FL_FREEZE});
  for (Change& change : changes) {
    if (change.kind == Change::Kind::kConstant && change.present && change.value == Qundef) {
      change.kind = Change::Kind::kAutoload;
      change.value = rb_autoload_p(change.module, change.name);
    }
    VALUE ignored;
    Protect(UndoBody, reinterpret_cast<VALUE>(&change), ignored);
  }
  ClearCaches(changes);
  for (Baseline& baseline : baselines)
    if (baseline.outdated) Take(baseline);
  constantState = ruby_vm_global_constant_state;
}

ID ChangesName() {
  static const ID name = rb_intern("changes");  // no variable for Ruby code
  return name;
}

VALUE ObjectsToWatch() {
  return rb_eval_string(
      "[$LOAD_PATH, $LOADED_FEATURES, Thread.main, TOPLEVEL_BINDING.receiver, "
      "*Object.constants(false).reject { |name| Object.autoload?(name) }"
      ".map { |name| Object.const_get(name) }]");
}

// What Start relies on.
void CheckLayout() {
  VALUE entry = 0;
  if (OriginOf(rb_cString) == rb_cString && ClassOf(rb_cString)->super &&
      rb_id_table_lookup(MethodsOf(rb_cString), rb_intern("upcase"), &entry) &&
      reinterpret_cast<MethodEntry*>(entry)->name == rb_intern("upcase") &&
      reinterpret_cast<MethodEntry*>(entry)->owner == rb_cString &&
      rb_const_lookup(rb_cObject, rb_intern("String"))->value == rb_cString)
    return;
  rb_raise(rb_eNotImpError, "this CRuby keeps the tables of its classes elsewhere");
}

}  // namespace

void ClassSnapshot::Start() {
  CheckLayout();
  libraryFolder = ActiveScriptConst("LIBRARY");
  rb_gc_register_mark_object(libraryFolder);
  rb_define_global_function("require", Require, 1);
  const VALUE objects = ObjectsToWatch();
  places = st_init_numtable();
  keeper = TypedData_Wrap_Struct(0, &kKeeperType, &baselines);
  rb_gc_register_mark_object(keeper);
  rb_gc_register_address(&inPlace);
  const bool collects = !RTEST(rb_gc_disable());  // the list keeps no module alive
  List<VALUE> modules = {};
  rb_objspace_each_objects(CollectModule, &modules);
  for (const VALUE module : modules) Take(Track(module));
  for (const VALUE module : modules)
    if (!SingletonOf(module)) singles.Add({module, IsFrozen(module)});
  xfree(modules.items);
  if (collects) rb_gc_enable();
  for (long i = 0; i < RARRAY_LEN(objects); ++i) {
    const VALUE object = RARRAY_AREF(objects, i);
    if (!RB_SPECIAL_CONST_P(object) && !IsModule(object)) singles.Add({object, IsFrozen(object)});
  }
  const VALUE own = ActiveScriptModule();
  BaselineOf(own)->keepsVariables = true;
  for (const Constant& constant : BaselineOf(own)->constants)
    if (IsModule(constant.entry.value)) BaselineOf(constant.entry.value)->keepsVariables = true;
  constantState = ruby_vm_global_constant_state;
}

static VALUE SuspendBody(VALUE context) {
  const volatile VALUE changes = NewChanges();
  UndoAll(ListOf(changes));
  if (!NIL_P(context)) rb_ivar_set(context, ChangesName(), ListOf(changes).count ? changes : Qnil);
  return Qnil;
}

static VALUE ResumeBody(VALUE context) {
  const VALUE changes = rb_attr_get(context, ChangesName());
  if (NIL_P(changes)) return Qnil;
  constantState = 0;
  VALUE ignored;
  for (Change& change : ListOf(changes))
    Protect(RedoBody, reinterpret_cast<VALUE>(&change), ignored);
  ClearCaches(ListOf(changes));
  return Qnil;
}

VALUE ClassSnapshot::Suspend() {
  const VALUE context = inPlace;
  VALUE ignored;
  inPlace = Qnil;
  if (!NIL_P(context)) Protect(SuspendBody, context, ignored);
  return context;
}

void ClassSnapshot::Resume(VALUE context) {
  VALUE ignored;
  inPlace = context;
  if (!NIL_P(context)) Protect(ResumeBody, context, ignored);
}

void ClassSnapshot::DropChanges() {
  VALUE ignored;
  Protect(SuspendBody, Qnil, ignored);
}
