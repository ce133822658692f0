# Draws what bench/run measured: gnuplot -e "table='...'; growth='...'; plot_file='...'" bench/plot.gp
set terminal svg size 960,680 font "sans-serif,13" background "white"
set output plot_file
set multiplot layout 2,2 margins 0.1,0.96,0.1,0.94 spacing 0.12,0.19
set grid ytics lc rgb "#dddddd"
set border 3
set tics nomirror out
set key top left reverse Left

set title "An ordinary launch-mode run"
set ylabel "time, ms (median)"
set yrange [0:*]
set offsets 0,0,graph 0.12,0
set style fill solid 0.85 noborder
set boxwidth 0.6
set xtics ("floor" 0, "launcher" 1, "script, dash" 2, "script, bash" 3)
set xrange [-0.6:3.6]
set datafile separator "|"
plot table skip 6 every ::::3 using 0:3:($0 == 1 ? 0x2166ac : 0x999999) with boxes lc rgb variable notitle, \
     "" skip 6 every ::::3 using 0:3:(sprintf("%.2f ms", $3)) with labels offset 0,0.7 notitle

set datafile separator "\t"
unset offsets
set xtics autofreq
set logscale xy
set yrange [1:1000]
set format x "%.0f"
set ylabel "time of the run, ms" offset 1,0

milliseconds(subject, field) = stringcolumn(1) eq subject ? column(field) : NaN
set style data linespoints
set style line 1 lw 2 pt 7 ps 0.6 lc rgb "#2166ac"
set style line 2 lw 2 pt 7 ps 0.6 lc rgb "#999999"
set style line 3 lw 2 pt 6 ps 0.6 lc rgb "#2166ac" dt 2

set title "Growth: the support list"
set xlabel "lines"
set xrange [1e3:1e6]
plot growth using 2:(milliseconds("support list, no type twice", 4)) ls 3 title "launcher, no type twice", \
     "" using 2:(milliseconds("support list", 4)) ls 1 title "launcher, 10,000 types", \
     "" using 2:(milliseconds("support list", 5)) ls 2 title "floor"

set title "Growth: the package tool's output"
set xlabel "MB"
set xrange [1:100]
plot growth using 2:(milliseconds("tool output", 4)) ls 1 title "launcher", \
     "" using 2:(milliseconds("tool output", 5)) ls 2 title "floor"

set title "Growth: the command line"
set xlabel "arguments"
set xrange [1e3:1e5]
plot growth using 2:(milliseconds("command line", 4)) ls 1 title "launcher", \
     "" using 2:(milliseconds("command line", 5)) ls 2 title "floor"
unset multiplot
