# SPDX-License-Identifier: MIT
# What log-macro.rbs does, as a program that reads the file by itself: log-plain.rb FILE MODE, the mode
# being "r", which looks for line ends of two characters, or "rb", which does not.
kept = []
File.foreach(ARGV.fetch(0), mode: ARGV.fetch(1), chomp: true) do |line|
  kept << line if line.include?(" ERROR ")
end
$stdout.binmode
kept.map { |line| line[/\[(\w+)\]/, 1] }.tally.sort.each do |part, count|
  print "#{part}: #{count}\n"
end
kept.sort.each { |line| print "#{line}\n" }
