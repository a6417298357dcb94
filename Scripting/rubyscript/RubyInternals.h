// SPDX-License-Identifier: MIT
// What the engine uses of CRuby 3.1 beyond its public headers: the tables of a class, and functions
// that CRuby's library exports. The build pins CRuby's version, and ClassSnapshot's CheckLayout
// raises with another layout. The functions send no message unless they say so, so a macro that
// redefines methods does not change what they do.
//
// Threading: Ruby side (see Interpreter.h).
#pragma once

#include <ruby.h>

struct rb_id_table;
struct st_table;

namespace cruby {

constexpr unsigned long kRefined = 11;  // the type of a method that a refinement shadows

struct MethodEntry;

struct MethodDefinition {
  unsigned long type : 4;
  unsigned long counts[1];
  MethodEntry* refined;  // of the type kRefined: the method itself, or null
};

// A heap object: a VALUE that the collector knows.
struct MethodEntry {
  VALUE flags;
  VALUE definedClass;
  MethodDefinition* definition;
  ID name;
  VALUE owner;
};

struct ConstantEntry {
  int flag;
  int line;
  VALUE value;  // Qundef: still to be loaded
  VALUE file;
};

struct ClassExtension {
  st_table* variableIndexes;
  st_table* variables;
  rb_id_table* constants;
  void* others[6];
  unsigned long long serial;
  VALUE origin;  // holds the methods when a module has been prepended
};

struct Class {
  RBasic basic;
  VALUE super;
  ClassExtension* extension;
  rb_id_table* methods;
};

inline Class* ClassOf(VALUE module) { return reinterpret_cast<Class*>(module); }

}  // namespace cruby

extern "C" {
size_t rb_id_table_size(const rb_id_table* table);
int rb_id_table_lookup(rb_id_table* table, ID key, VALUE* value);
int rb_id_table_delete(rb_id_table* table, ID key);
void rb_id_table_foreach(rb_id_table* table, int (*visit)(ID, VALUE, void*), void* data);
void rb_id_table_foreach_values(rb_id_table* table, int (*visit)(VALUE, void*), void* data);
void rb_method_table_insert(VALUE owner, rb_id_table* table, ID name,
                            const cruby::MethodEntry* entry);
cruby::MethodEntry* rb_method_entry_clone(const cruby::MethodEntry* entry);
VALUE rb_method_entry_location(const cruby::MethodEntry* entry);
void rb_clear_method_cache(VALUE module, ID name);
void rb_clear_method_cache_all(void);
void rb_class_subclass_add(VALUE super, VALUE klass);
void rb_class_remove_from_super_subclasses(VALUE klass);
cruby::ConstantEntry* rb_const_lookup(VALUE module, ID name);
void rb_autoload_str(VALUE module, ID name, VALUE file);
void rb_objspace_each_objects(int (*visit)(void*, void*, size_t, void*), void* data);
VALUE rb_suppress_tracing(VALUE (*body)(VALUE), VALUE argument);
// Of the process; each change of a constant, and each of a class variable's place.
extern __declspec(dllimport) unsigned long long ruby_vm_global_constant_state;
extern __declspec(dllimport) unsigned long long ruby_vm_global_cvar_state;

// Thread and Ractor objects hold the structures that these functions take: see RTYPEDDATA_DATA.
void rb_threadptr_pending_interrupt_enque(void* thread, VALUE exception);
void rb_threadptr_interrupt(void* thread);
VALUE rb_ractor_thread_list(void* ractor);

// Kernel#abort and Process.kill.
VALUE rb_f_abort(int count, const VALUE* arguments);
VALUE rb_f_kill(int count, const VALUE* arguments);

const void* rb_iseqw_to_iseq(VALUE instructionSequence);
VALUE rb_iseq_eval(const void* iseq);
}
