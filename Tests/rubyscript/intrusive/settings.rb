# SPDX-License-Identifier: MIT
# Frozen objects, hooks and settings that belong to Ruby as a whole.
# ---
$LOADED_FEATURES.freeze
# ---
$LOADED_FEATURES.clear
# ---
$LOADED_FEATURES << nil << 5 << Object.new
# ---
$LOADED_FEATURES << "x"; $LOADED_FEATURES.freeze
# ---
$LOAD_PATH.clear.freeze
# ---
$LOAD_PATH << nil
# ---
ARGV << 1; ARGV.freeze
# ---
def ARGV.replace(*) = raise("replace")
def ARGV.==(other) = raise("==")
ARGV << 1
# ---
def $LOADED_FEATURES.reject = raise("reject")
def $LOADED_FEATURES.concat(*) = raise("concat")
def ($LOAD_PATH).dup = raise("dup")
# ---
Object.freeze
# ---
Object.freeze; class String; def x = 1; end; String.freeze
# ---
[BasicObject, Kernel, Module, Class, Comparable, String, Array, Hash, ActiveScript].each(&:freeze)
# ---
[Object, String, Kernel].each { |each| each.singleton_class.freeze }
# ---
ActiveScript.constants.each { |name| ActiveScript.const_get(name).freeze }
# ---
STDOUT.freeze; STDERR.freeze; STDIN.freeze; $stdout.freeze
puts "x"
# ---
Thread.current.freeze; Thread.main.freeze
# ---
ENV.delete("PATH"); ARGF.freeze; TOPLEVEL_BINDING.freeze
# ---
set_trace_func(proc { |*| raise "trace" })
# ---
set_trace_func(proc { |event, *| raise "trace" if event == "c-call" })
# ---
TracePoint.new(:line, :call, :c_call, :return, :c_return) { raise "trace point" }.enable
# ---
TracePoint.new(:raise) { raise "trace point" }.enable
raise "x"
# ---
@point = TracePoint.new(:call) { |point| @item.f(point.method_id.to_s) if point.method_id == :called }
@point.enable
def called = 1
called
# ---
Thread.current.set_trace_func(proc { |*| raise "trace" })
# ---
trace_var(:$stdout) { raise "traced" }
$stdout = $stdout
# ---
trace_var(:$global, proc { |value| @item.f(value) })
$global = 1
# ---
$stdout = Object.new.tap { |object| def object.write(*) = 1 }
puts "x"
# ---
$stdout = nil
# ---
$global = Class.new(BasicObject).new
$other = BasicObject.new
# ---
$global = Object.new.tap { |object| def object.equal?(*) = ::Kernel.raise("equal?"); def object.==(*) = ::Kernel.raise("==") }
# ---
$; = "x"; $, = "y"; $/ = "z"; $\ = "e"
# ---
$VERBOSE = true; $DEBUG = true; $-w = true
# ---
Thread.abort_on_exception = true
Thread.report_on_exception = false
# ---
GC.disable; GC.stress = true
# ---
Encoding.default_external = "UTF-16LE"; Encoding.default_internal = "UTF-32BE"
# ---
Thread.current[:x] = 1; Thread.current.thread_variable_set(:y, 2); Thread.current.name = "mine"
# ---
Thread.current.priority = -3
Thread.current.report_on_exception = false
# ---
ENV["PATH"] = "x"; ENV["RUBYOPT"] = "-w"; ENV.clear
# ---
Dir.chdir("C:/"); File.umask(0)
# ---
srand(5); Random.srand(6)
@item.f(rand(1000))
# ---
Signal.trap("INT") { raise "trapped" }; Signal.trap("EXIT") { raise "exit" }
# ---
at_exit { raise "late" }
# ---
at_exit { at_exit { raise "later" }; exit(3) }
# ---
ObjectSpace.each_object(Class) { |each| each.freeze if each.singleton_class? && rand < 0.2 }
# ---
ObjectSpace.each_object(Module) { |each| each.freeze }
# ---
Thread.new { Thread.current.report_on_exception = false; Thread.main.raise("from a thread"); sleep }
sleep 0.1
# ---
Thread.new { loop { Thread.pass } }
# ---
Thread.new { begin; sleep; ensure; Thread.pass; end }
Thread.pass
# ---
Thread.handle_interrupt(Exception => :never) { 1 }
# --- once
ObjectSpace.define_finalizer(Object.new, proc { raise "finalizer" })
GC.start
# ---
Fiber.new { Fiber.yield }.resume
@fiber = Fiber.new { raise "in a fiber" }
@fiber.resume
# ---
catch(:x) { Thread.new { throw :x }.join }
# ---
throw :outside
# ---
$PROGRAM_NAME = "x" * 1000
# ---
$stderr = STDOUT; $stdin = nil
# ---
eval("BEGIN { $begun = 1 }; END { raise 'end' }")
# ---
TOPLEVEL_BINDING.local_variable_set(:leaked, 1)
TOPLEVEL_BINDING.eval("def leaked_too = 1")
@item.f(TOPLEVEL_BINDING.local_variable_get(:leaked))
# ---
Warning[:deprecated] = true; Warning[:experimental] = false
def Warning.warn(text, **) = @item.f(text)
# ---
RubyVM::InstructionSequence.compile_option = { trace_instruction: false, tailcall_optimization: true }
# ---
GC.compact
# ---
exit!
# ---
Kernel.exit(false)
# ---
def f = f()
f
# ---
raise Class.new(Exception) { def message = raise("no message"); def backtrace = nil }
# ---
raise Class.new(StandardError) { def self.name = raise("no name"); def self.to_s = raise("no text") }, "x"
# ---
1 +
# ---
a = []; a << a; raise a.inspect * 10
