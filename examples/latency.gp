# Draws read and write latency over time, for all priorities together, in any layout:
#   morwick snapshot -o csv > snapshot.csv
#   gnuplot -e "csv='snapshot.csv'" latency.gp > latency.png
if (!exists("csv")) csv = "snapshot.csv"
set datafile separator ","
set terminal pngcairo size 900,420
set title "Latency of host operations"
set xlabel "seconds since the first record"
set ylabel "mean latency (us)"
set logscale y
set grid
set key top left

# The columns of a label, one for each priority, by the first line.
names = system("head -n 1 '" . csv . "' | tr ' ,' '_ '")
total(label) = sum [i = 1:words(names)] \
    (word(names, i) . "_")[1:strlen(label) + 1] eq label . "_" ? column(i) : 0
mean(kind) = total(kind . "L") / total(kind . "O")

stats csv using "T" every ::0::0 nooutput
first = STATS_min
plot csv using (column("T") - first):(mean("R")) with lines linewidth 2 title "read", \
     csv using (column("T") - first):(mean("W")) with lines linewidth 2 title "write"
