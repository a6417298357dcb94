# SPDX-License-Identifier: MIT
# Changes to classes and modules that every macro shares.
# --- > item.f('A!')
class String; alias old_upcase upcase; def upcase = old_upcase + "!"; end
@item.f("a".upcase)
# --- > item.f('MyBase')
module Comparable; MyBase = Class.new; class Mine < MyBase; end; end
@item.f(Comparable::Mine.superclass.name.split("::").last)
# ---
class String; class Inner; end; LIMIT = 1; end
@item.f(String::LIMIT)
# ---
class String; def each_word(&block) = split.each(&block); end
@item.f("a b".each_word.to_a)
# ---
module Loud; def upcase = super + "!"; end
String.prepend(Loud)
@item.f("a".upcase)
# ---
module Quiet; def hush = downcase; def hash(x) = x; end
String.include(Quiet)
@item.f("A".hush)
# ---
module Hashed; def hash(x) = x; end
Object.include(Hashed)
# ---
module Hashed; def hash(x) = x; def ==(x) = raise("=="); end
Object.prepend(Hashed)
# ---
include Math
@item.f(sqrt(4))
# ---
require "fileutils"
include FileUtils
@item.f(respond_to?(:mkdir_p, true))
# ---
module Extra; def extra = 1; end
Kernel.include(Extra)
Comparable.include(Extra)
Enumerable.prepend(Extra)
@item.f([1.extra, [].extra])
# ---
String.extend(Module.new { def new(*) = raise("new") })
Module.extend(Module.new { def new(*) = raise("new") })
# ---
class Array; def replace(*) = raise("replace"); def each = raise("each"); def ==(other) = raise("=="); end
# ---
class Array; def map = raise("map"); def -(other) = raise("-"); def push(*) = raise("push"); def last = raise("last"); end
# ---
class Array; def to_ary = raise("to_ary"); def to_a = raise("to_a"); def pop = raise("pop"); def include?(*) = true; end
# ---
class Hash; def each = raise("each"); def key?(*) = raise("key?"); def [](*) = 1; def []=(*); end; def fetch(*) = 2; end
# ---
class Hash; def to_h = raise("to_h"); def keys = raise("keys"); def merge(*) = raise("merge"); def empty? = true; end
# ---
class Hash; undef_method :[], :[]=, :each, :key?; end
# ---
class String; def ==(other) = true; def hash = 1; def eql?(other) = true; end
# ---
class String; def empty? = false; def size = 0; def split(*) = raise("split"); def b = raise("b"); end
# ---
class String; undef_method :to_s, :to_str, :start_with?, :b, :match, :dup, :encoding; end
raise "x"
# ---
class String; def force_encoding(*) = raise("force"); def include?(*) = raise("include?"); def scrub = raise("scrub"); end
raise "x"
# ---
class Symbol; def to_s = raise("to_s"); def to_proc = raise("to_proc"); def ==(other) = false; def hash = 1; end
# ---
class Integer; def +(other) = 0; def -(other) = 0; def ==(other) = true; def <(other) = true; def succ = self; end
# ---
class Integer; def coerce(*) = raise("coerce"); def to_int = raise("to_int"); def zero? = true; def positive? = false; end
# ---
class NilClass; def method_missing(*) = nil; def respond_to_missing?(*) = true; def to_a = [1]; def nil? = false; end
@item.f(nil.foo.bar)
# ---
class TrueClass; def !; true; end; def &(other) = false; end
class FalseClass; def !; false; end; end
# ---
class Proc; def call(*) = raise("call"); def to_proc = raise("to_proc"); def ===(*) = raise("==="); end
# ---
class Range; def each = raise("each"); def ===(*) = true; def first(*) = raise("first"); end
# ---
class Exception; def message = raise("message"); def backtrace = raise("backtrace"); end
raise "x"
# ---
class Exception; def self.===(other) = true; def self.new(*) = nil; def self.exception(*) = nil; end
Integer("x") rescue 1
raise "x"
# ---
class Exception; def backtrace_locations = 5; def to_s = 6; def full_message(*) = 7; def class = 8; end
raise "x"
# ---
class SystemExit; def success? = raise("success?"); end
exit
# ---
class StandardError; def initialize(*) = raise("initialize"); end
raise "x"
# ---
class Module; def method_added(name) = raise("method_added #{name}"); end
def f = 1
# ---
class Module; def method_removed(*) = raise("removed"); def method_undefined(*) = raise("undefined"); end
# ---
class Module; def const_missing(name) = raise("const_missing"); def const_get(*) = 1; def constants(*) = []; end
# ---
class Module; def remove_const(*) = raise("remove_const"); def const_set(*) = raise("const_set"); end
# ---
class Module; def instance_method(*) = raise("im"); def define_method(*) = raise("dm"); def instance_methods(*) = []; end
# ---
class Module; def ===(other) = raise("==="); def name = raise("name"); def ==(other) = raise("=="); def hash = 1; end
raise "x"
# ---
class Module; def include(*) = raise("include"); def prepend(*) = raise("prepend"); def attr_accessor(*) = raise("attr"); end
# ---
class Module; def append_features(*) = 1; def included(*) = raise("included"); def extended(*) = raise("extended"); end
# ---
class Class; def new(*) = raise("new"); def inherited(*) = raise("inherited"); def allocate = raise("allocate"); end
class Sub; end
# ---
class Class; def superclass = raise("superclass"); end
def Object.inherited(sub) = raise("inherited")
class Sub; end
# ---
def Object.method_added(name) = raise("added #{name}")
def Object.const_missing(name) = name
def Object.const_get(*) = raise("const_get")
def Object.constants(*) = raise("constants")
@item.f(Nowhere.to_s)
# ---
def Thread.list = raise("list")
def Thread.current = raise("current")
def Thread.main = raise("main")
def Thread.handle_interrupt(*) = raise("handle_interrupt")
# --- once
class Thread; def kill = raise("kill"); def join(*) = raise("join"); def [](*) = raise("[]"); def keys = raise("keys"); end
Thread.new { sleep }
# ---
def File.dirname(*) = raise("dirname")
def Dir.pwd = raise("pwd")
def IO.new(*) = raise("new")
class IO; def flush = raise("flush"); def write(*) = raise("write"); def closed? = raise("closed?"); end
puts "x"
# ---
def ObjectSpace.each_object(*) = raise("each_object")
def GC.enable = raise("enable")
def GC.stress=(*); raise("stress="); end
def Warning.[](*) = raise("[]")
def Warning.warn(*) = raise("warn")
# ---
def Encoding.default_external = raise("default_external")
def Encoding.default_external=(*); raise("default_external="); end
class Encoding; def ==(*) = raise("=="); def name = raise("name"); end
# ---
def Fiber.current = raise("current")
def Fiber.yield(*) = raise("yield")
class Fiber; def resume(*) = raise("resume"); end
# ---
def Struct.new(*) = raise("new")
class Struct; def initialize(*) = raise("initialize"); end
# ---
class Method; def source_location = raise("sl"); def unbind = raise("unbind"); def owner = 1; end
class UnboundMethod; def bind(*) = raise("bind"); def bind_call(*) = raise("bc"); def source_location = raise("sl"); end
# ---
class Binding; def eval(*) = raise("eval"); def receiver = raise("receiver"); end
def RubyVM.stat(*) = raise("stat")
class RubyVM::InstructionSequence; def eval = raise("eval"); def self.compile(*) = raise("compile"); end
# ---
class MatchData; def captures = raise("captures"); def [](*) = raise("[]"); def pre_match = raise("pre"); end
class Regexp; def match(*) = raise("match"); def =~(*) = raise("=~"); def ===(*) = raise("==="); def match?(*) = true; end
"x" =~ /x/
raise "x"
# ---
class StringIO; def initialize(*) = raise("initialize"); def write(*) = raise("write"); def pos = raise("pos"); end
puts "x"
# ---
class Thread::Backtrace::Location; def path = raise("path"); def lineno = raise("lineno"); end
raise "x"
# ---
class Time; alias old_now now rescue 1; def self.now = 5; def to_f = 6; def -(other) = 7; end
@item.f(Time.now)
# ---
class Time; class << self; alias old_now now; def now = old_now.year.class; end; end
@item.f(Time.now.name)
# ---
class << String; def new(*) = raise("new"); end
class << Array; def new(*) = raise("new"); alias [] new; end
class << Hash; def new(*) = raise("new"); end
# ---
module Enumerable; def map = raise("map"); def to_set = raise("to_set"); def select = 1; def sum(*) = 1; end
# ---
module Comparable; def ==(other) = raise("=="); def clamp(*) = 1; end
# ---
module Kernel; def self.format(*) = raise("format"); def format(*) = raise("format"); def Integer(*) = 1; end
# ---
class Array; alias_method :old_first, :first; define_method(:first) { |*| :other }; end
@item.f([1].first)
# ---
String.class_eval { attr_accessor :note; @@shared = 1; @own = 2 }
@item.f([String.class_variables, String.instance_variables, "".note])
# ---
class Object; @@everywhere = 1; def everywhere = @@everywhere; end
@item.f([Object.class_variables, everywhere])
# ---
Object.class_variable_set(:@@late, 2)
Comparable.class_variable_set(:@@late, 3)
# ---
class Object; CONST = 1; private_constant :CONST; end
@item.f((Object::CONST rescue 2))
# ---
class Object; private_constant :String; deprecate_constant :Array; end
# ---
Object.send(:remove_const, :String)
Object.send(:remove_const, :Comparable)
# ---
Object.send(:remove_const, :Object)
# ---
Object.send(:remove_const, :ActiveScript)
# ---
String = 5
Exception = 6
raise "x"
# ---
RUBY_VERSION = "9"
ARGV = [1]
ENV = {}
@item.f([RUBY_VERSION, ARGV, ENV])
# ---
Float::INFINITY = 3
Float.send(:remove_const, :NAN)
Process.send(:remove_const, :CLOCK_MONOTONIC)
# ---
module ActiveScript; class Context; def leave = raise("leave"); def enter = raise("enter"); end; end
# ---
module ActiveScript; class Context; undef_method :run, :call, :describe, :close; end; end
# ---
module ActiveScript; class << self; undef_method :can_call?; end; HostOutput.undef_method(:write, :finish); end
puts 1
# ---
ActiveScript.constants.each { |name| ActiveScript.send(:remove_const, name) }
# ---
ActiveScript::Context.const_set(:ENTERED, []) if ActiveScript::Context.frozen?
class ActiveScript::ComObject; def method_missing(*) = 1; def inspect = raise("inspect"); end
# ---
require "json"
module JSON; def self.generate(*) = 1; EXTRA = 2; class Mine; end; end
@item.f([JSON.generate([]), JSON::EXTRA, JSON::Mine.name])
# ---
module JSON; EXTRA = 3; end
require "json"
@item.f([JSON::EXTRA, JSON.generate([1])])
# ---
require "set"
class Set; alias old_add add; def add(x) = old_add([x]); end
@item.f(Set.new.add(1).to_a.inspect)
# ---
require "date"
class Date; def to_s = "date"; class Mine < Date; end; end
class Time; alias my_to_date to_date; def to_date = 1; end
@item.f([Date.new(2000).to_s, Time.at(0).to_date])
# ---
require "time"
class Time; alias old_iso8601 iso8601; def iso8601(*) = old_iso8601.size; end
@item.f(Time.at(0).utc.iso8601)
# ---
require "English"
alias $my_error $ERROR_INFO
alias $STDOUT $stdout
# ---
using(Module.new { refine(String) { def upcase = "refined"; def extra = 1 } })
@item.f(["a".upcase, "a".extra])
# ---
module Refined; refine(Object) { def then = 5; def hash = 6 }; end
using Refined
class String; def upcase = then.to_s; end
@item.f([1.then, "a".upcase])
# ---
using(Module.new { refine(Integer) { def +(other) = 42; def to_s = "n" } })
class Integer; def to_s = "other"; end
@item.f([1 + 1, 1.to_s])
# ---
autoload :Zlib2, "nowhere"
Comparable.autoload :Later, "nowhere"
@item.f(Comparable.autoload?(:Later))
# ---
class Sub < String; def upcase = super + "?"; end
class String; def upcase = "x"; end
@item.f(Sub.new("a").upcase)
# ---
class Base; def self.inherited(sub) = (@subs ||= []) << sub.name; def self.subs = @subs; end
class A < Base; end
@item.f(Base.subs)
# ---
Point = Struct.new(:x); Struct.new("Named", :y); class Struct; def extra = 1; end
@item.f([Point.new(1).extra, Struct::Named.name])
# ---
Object.define_method(:everything) { 1 }
Integer.define_method(:half) { self / 2 }
@item.f([4.half, nil.everything])
# ---
[String, Array, Hash, Integer].each { |type| type.send(:define_method, :kind) { type.name } }
@item.f([1, "a", [], {}].map(&:kind))
# ---
String.remove_method(:upcase)
Array.undef_method(:first)
@item.f([("a".upcase rescue 1), ([].first rescue 2)])
# ---
[Kernel, Object, Module, String, Array, Hash].each { |each| each.instance_methods(false).each { |m| each.send(:private, m) rescue 1 } }
# ---
[String, Array, Hash, Symbol, Integer].each { |each| each.instance_methods(false).each { |m| each.send(:undef_method, m) } }
# ---
Enumerable.instance_methods.each { |m| Enumerable.send(:define_method, m) { |*| ::Kernel.raise("no #{m}") } }
# --- > item.f('[1]')
module Mine; end
class String; include Mine; end
class Hash; include Mine; end
require "json"
@item.f(JSON.generate([1]))
