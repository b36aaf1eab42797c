# Draws what changes over time:
#   morwick watch -s kvr -o csv --every 1 --count 60 > watch.csv
#   gnuplot -e "csv='watch.csv'; names='hostReads hostWrites'" rates.gp > rates.png
if (!exists("csv")) csv = "watch.csv"
if (!exists("names")) names = "hostReads hostWrites nandReads nandWrites"
set datafile separator ","
set terminal pngcairo size 900,420
set title "What the controller does"
set xlabel "time (UTC)"
set datafile missing NaN  # rows of other names do not break a line
set ylabel "per second"
set xdata time
set timefmt "%s"
set format x "%H:%M\n%S s"
set yrange [0:*]
set grid
set key outside right

plot for [wanted in names] csv skip 1 \
    using 1:(stringcolumn(2) eq wanted ? $5 : NaN) with linespoints pointtype 7 pointsize 0.4 title wanted
