# SPDX-License-Identifier: MIT
# Threads, exceptions, signals and output: what decides how a macro ends.
# ---
class String; def empty? = false; end
puts "x" * 600
# --- interrupt
define_method(:method_missing) { |*| 1 }
loop { }
# --- interrupt
ObjectSpace.each_object(Thread) { |thread| thread.kill unless thread == Thread.current }
loop { }
# --- interrupt
class Thread; def raise(*) = nil; end
loop { }
# ---
class Wrong < StandardError; def message = raise; def to_s = 1; def backtrace = raise; end
raise Wrong
# ---
at_exit { at_exit { raise "c" }; raise "b" }
raise "a"
# ---
ObjectSpace.define_finalizer(Object.new, proc { raise "x" })
# ---
Warning[:experimental] = false
Ractor.new { loop { } }
Ractor.new { Ractor.receive }
# ---
$stdout.reopen($stderr); $stderr.reopen($stdout)
# ---
trap(:INT) { raise "x" }
Thread.new { Process.kill(:INT, $$) }.join
sleep 0.02
# ---
ActiveScript::Stop.define_singleton_method(:===) { |*| raise }
