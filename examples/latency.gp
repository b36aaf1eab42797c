# Draws read and write latency over time, for all priorities together:
#   morwick snapshot -o csv snapshot.bin > snapshot.csv
#   gnuplot -e "csv='snapshot.csv'" latency.gp > latency.png
if (!exists("csv")) csv = "snapshot.csv"
set datafile separator ","
set terminal pngcairo size 900,420
set title "Latency of host operations"
set xlabel "time (s)"
set ylabel "mean latency (us)"
set logscale y
set grid
set key top left

total(part, kind) = column(kind . part . "_0") + column(kind . part . "_1") + \
                    column(kind . part . "_2") + column(kind . part . "_3")
mean(kind) = total("L", kind) / total("O", kind)

plot csv using "T":(mean("R")) with lines linewidth 2 title "read", \
     csv using "T":(mean("W")) with lines linewidth 2 title "write"
