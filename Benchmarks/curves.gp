# SPDX-License-Identifier: MIT
# Nanoseconds for each element over the number of elements as an SVG, a panel for each case. The
# caller sets `data` and `result`.
set datafile separator "\t"
set terminal svg noenhanced size 1000, 1100 font "sans-serif,12" background "white"
set output result
set multiplot layout 4, 2
set logscale xy
set xlabel "elements"
set ylabel "ns for each"
set grid
set key top left
do for [case = 0:6] {
  plot data index case using 2:3 with linespoints pointtype 7 linecolor "#205080" title columnheader(1), \
       data index case using 2:4 with linespoints pointtype 6 linecolor "#c03020" title columnheader(4)
}
unset multiplot
