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

# The columns of a label by the first line: one for each priority, X_0, but none of a label X_2, X_2_0.
names = system("sed -n '1{y/ ,/_ /;p;q}' '" . csv . "'")
if (GPVAL_SYSTEM_ERRNO != 0) { exit status 1 }
rest(name, label) = (name . "_")[strlen(label) + 2:*]
has(name, label) = name . "_" eq label . "_" . rest(name, label) \
    && strstrt(rest(name, label), "_") == strlen(rest(name, label))
count(label) = sum [i = 1:words(names)] has(word(names, i), label)
total(label) = sum [i = 1:words(names)] has(word(names, i), label) ? column(i) : 0
mean(kind) = total(kind . "L") / total(kind . "O")

do for [label in "T RO RL WO WL"] {
    if (count(label) == 0) {
        printerr csv . ": there is no column of " . label
        exit status 1
    }
}
stats csv using "T" every ::0::0 nooutput
first = STATS_min
plot csv using (column("T") - first):(mean("R")) with lines linewidth 2 title "read", \
     csv using (column("T") - first):(mean("W")) with lines linewidth 2 title "write"
