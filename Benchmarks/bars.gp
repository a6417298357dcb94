# SPDX-License-Identifier: MIT
# Ratios of one group as an SVG: the median, the spread of the rounds, and the goal. The caller sets
# `data`, `result` and `caption`.
set datafile separator "\t"
set datafile missing "?"
stats data using 2 nooutput
rows = STATS_records
set terminal svg noenhanced size 900, 110 + 26 * rows font "sans-serif,12" background "white"
set output result
set title caption
set logscale x
set xrange [0.02:*]
set xlabel "time : peer's time (median, least and greatest of the rounds)"
set yrange [-rows + 0.5 - 1:0.5]
set grid xtics
set key outside bottom center horizontal
set arrow from 1, graph 0 to 1, graph 1 nohead dashtype 2
plot data using 2:(-$0):3:4:ytic(1) with xerrorbars pointtype 7 linecolor "#205080" title "measured", \
     data using 5:(-$0) with points pointtype 9 pointsize 1.2 linecolor "#c03020" title "goal, at most"
