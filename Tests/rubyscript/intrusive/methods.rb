# SPDX-License-Identifier: MIT
# Top-level methods with names that Ruby itself uses, and the same in its base classes.
# ---
def hash(text) = text.size
@item.f(hash("four"))
# ---
def raise(*) = 1
1.upto
# ---
def method(name) = name
# ---
def then = 1
# ---
def class = String
# ---
def freeze = 1
# ---
def to_ary = [1]
# ---
def to_a = raise("to_a")
# ---
def ==(other) = true
# ---
def !=(other) = true
# --- once: the name suggestion fails while it loads a library
def ! = true
# ---
def equal?(other) = true
# ---
def eql?(other) = raise("eql?")
# ---
def __send__(*) = raise("__send__")
# ---
def send(*) = raise("send")
# ---
def __id__ = 1
# ---
def object_id = 1
# ---
def respond_to?(*) = raise("respond_to?")
# ---
def respond_to_missing?(*) = raise("respond_to_missing?")
# ---
def method_missing(name, *) = 1
anything_at_all
# ---
public def method_missing(name, *) = raise("missing #{name}")
nil.anything_at_all
# ---
def inspect = raise("inspect")
def to_s = raise("to_s")
1.upto
# ---
def is_a?(*) = false
def kind_of?(*) = false
def instance_of?(*) = false
def nil? = true
def ===(*) = false
def =~(*) = raise("=~")
raise "x"
# ---
def tap = raise("tap")
def loop = raise("loop")
def catch(*) = raise("catch")
def throw(*) = raise("throw")
def proc = raise("proc")
def lambda = raise("lambda")
# ---
def require(*) = raise("require")
def load(*) = raise("load")
def puts(*) = raise("puts")
def p(*) = raise("p")
def print(*) = raise("print")
def warn(*) = raise("warn")
# ---
def caller(*) = raise("caller")
def binding = raise("binding")
def block_given? = raise("block_given?")
def sleep(*) = raise("sleep")
def exit(*) = 1
def abort(*) = 1
# ---
def at_exit = raise("at_exit")
# ---
def global_variables = raise("global_variables")
def set_trace_func(*) = raise("set_trace_func")
def untrace_var(*) = raise("untrace_var")
def trace_var(*) = raise("trace_var")
# ---
def instance_variable_get(*) = raise("get")
def instance_variable_set(*) = raise("set")
def instance_variable_defined?(*) = raise("defined")
def instance_variables = raise("variables")
# ---
def define_method(*) = raise("define_method")
def remove_method(*) = raise("remove_method")
def const_get(*) = raise("const_get")
def const_missing(*) = raise("const_missing")
def extend(*) = raise("extend")
def clone(*) = raise("clone")
def dup = raise("dup")
# ---
def initialize(*) = raise("initialize")
# ---
public def initialize(*) = super()
# ---
def size = raise("size")
def each = raise("each")
def call(*) = raise("call")
def key?(*) = raise("key?")
def empty? = raise("empty?")
def message = raise("message")
def backtrace = raise("backtrace")
def exception(*) = raise("exception")
1.upto
# ---
def itself = raise("itself")
def singleton_class = raise("singleton_class")
def singleton_methods(*) = raise("singleton_methods")
def instance_eval(*) = raise("instance_eval")
def instance_exec(*) = raise("instance_exec")
# ---
def singleton_method_added(name) = raise("singleton_method_added #{name}")
def self.x = 1
# ---
def private(*) = raise("private")
def public(*) = raise("public")
def include(*) = raise("include")
def using(*) = raise("using")
# ---
def self.method_missing(*) = 1
def self.respond_to?(*) = true
anything_at_all
# --- once: as above
def self.to_s = raise("to_s")
def self.inspect = raise("inspect")
undefined_thing
# ---
def self.hash = raise("hash")
def self.class = raise("class")
def self.instance_variable_set(*) = raise("set")
raise "x"
# ---
freeze
@x = 1
# ---
undef_method = 1
self.class.send(:undef_method, :puts)
# ---
class Object; undef_method :hash; end
# ---
class Object; undef_method :send; end
# ---
class BasicObject; undef_method :__send__; end
# ---
class BasicObject; undef_method :equal?; end
# ---
module Kernel; undef_method :raise; end
# ---
module Kernel; remove_method :require; end
# ---
module Kernel; remove_method :instance_variable_set, :then, :tap, :class, :respond_to?; end
# ---
module Kernel; def puts(*) = ::Kernel.raise("puts"); end
# ---
module Kernel; def self.raise(*) = 1; end
1.upto
# ---
module Kernel; private :class, :is_a?, :respond_to?, :hash, :freeze; end
# ---
class Object; private :instance_variable_get; public :puts; end
nil.puts
# ---
class BasicObject; def method_missing(*) = 1; end
nil.anything
# ---
class BasicObject; def ==(other) = ::Kernel.raise("=="); end
# ---
class BasicObject; def !(*) = ::Kernel.raise("!"); end
# ---
class BasicObject; def initialize(*) = ::Kernel.raise("initialize"); end
# ---
class BasicObject; private :equal?, :__send__, :__id__, :instance_eval; end
