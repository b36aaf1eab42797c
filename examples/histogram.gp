# Draws a histogram, an array of the statistics:
#   morwick stats -s kvr -o csv > stats.csv
#   gnuplot -e "csv='stats.csv'; name='hostReadLogHisto'" histogram.gp > histogram.png
if (!exists("csv")) csv = "stats.csv"
if (!exists("name")) name = "hostReadLogHisto"
set datafile separator ","
set terminal pngcairo size 900,420
set title name
set xlabel "element"
set ylabel "count"
set logscale y
set grid y
set style fill solid 0.6
set boxwidth 0.8
unset key

# An element's name ends with its number; other names are left out.
number(text) = text[strlen(name) + 1:*]
element(text) = text[1:strlen(name)] eq name && number(text) eq sprintf("%d", int(number(text) . "")) \
    ? int(number(text)) : NaN

found = system("grep -cE '^" . name . "[0-9]+,' '" . csv . "'")
if (GPVAL_SYSTEM_ERRNO != 0) {
    if (found eq "0") { printerr csv . ": there is no array " . name }
    exit status 1
}
plot csv using (element(stringcolumn(1))):2 skip 1 with boxes
