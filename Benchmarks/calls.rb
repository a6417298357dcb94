# SPDX-License-Identifier: MIT
# Times the same calls of one object in turns, as the engine's `@tarn` and through win32ole.
# win32ole creates the object by its `class_id`. The object receives the seconds of one call.
require "win32ole"

ROUNDS = 9
TURNS = 5
CALLS = 10_000

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

def median(values) = values.sort[values.size / 2]

peer = WIN32OLE.new(@tarn.class_id)
loops = [method(:call_with_arguments), method(:call_without_arguments)]
[@tarn, peer].each { |object| raise "wrong answer" unless object.f(1, "text", 2.5) == 42 }

ROUNDS.times do
  loops.each_with_index do |each, index|
    own, other = [], []
    TURNS.times do |turn| # whatever the order does evens out
      own << seconds_per_call(@tarn, each) if turn.even?
      other << seconds_per_call(peer, each)
      own << seconds_per_call(@tarn, each) if turn.odd?
    end
    @tarn.take(index, median(own), median(other))
  end
end
