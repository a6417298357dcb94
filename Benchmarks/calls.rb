# SPDX-License-Identifier: MIT
# Times the same calls of one object, as the engine's `@tarn` and through win32ole, round by round.
# The object's `class_id` is what win32ole makes it by, and it is told the seconds of one call.
require "win32ole"

ROUNDS = 11
CALLS = 50_000

def seconds_per_call(object, loop_of_calls)
  GC.start
  start = Process.clock_gettime(Process::CLOCK_MONOTONIC)
  loop_of_calls.call(object)
  (Process.clock_gettime(Process::CLOCK_MONOTONIC) - start) / CALLS
end

def call_with_arguments(object)
  left = CALLS
  while left > 0
    object.f(1, "text", 2.5)
    left -= 1
  end
end

def call_without_arguments(object)
  left = CALLS
  while left > 0
    object.f
    left -= 1
  end
end

peer = WIN32OLE.new(@tarn.class_id)
loops = [method(:call_with_arguments), method(:call_without_arguments)]
[@tarn, peer].each { |object| raise "wrong answer" unless object.f(1, "text", 2.5) == 42 }

ROUNDS.times do |round|
  loops.each_with_index do |each, index|
    if round.even? # whatever the order does evens out
      own = seconds_per_call(@tarn, each)
      other = seconds_per_call(peer, each)
    else
      other = seconds_per_call(peer, each)
      own = seconds_per_call(@tarn, each)
    end
    @tarn.take(index, own, other)
  end
end
