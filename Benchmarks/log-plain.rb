# SPDX-License-Identifier: MIT
# What log-macro.rbs does, as a program that reads the file by itself.
kept = []
File.foreach(ARGV.fetch(0), chomp: true) do |line|
  kept << line if line.include?(" ERROR ")
end
$stdout.binmode
kept.map { |line| line[/\[(\w+)\]/, 1] }.tally.sort.each do |part, count|
  print "#{part}: #{count}\n"
end
kept.sort.each { |line| print "#{line}\n" }
