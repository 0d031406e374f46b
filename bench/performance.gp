# The time of a find over the number of names, from what tunnel_tables_bench has printed:
# gnuplot -e "figures='tunnel_tables_bench.out'" performance.gp
set terminal svg size 900,400 font 'sans-serif,12' background 'white'
set logscale xy
set xrange [80:12500]
set yrange [5:20000]
set xtics ('100' 100, '1k' 1000, '5k' 5000, '10k' 10000)
set xlabel 'names in the table'
set ylabel 'ns'
set grid
set key top left

# Lines of the number of names and the median time.
medians(table, shape) = sprintf("< awk '$1 ~ \"^find_hit/%s/%s/.*_median$\" { \
    split($1, part, \"/\"); print part[4], $2 }' %s | sort -n", table, shape, figures)

set multiplot layout 1,2
do for [panel in "20_bytes 32_bytes_front"] {
    set title panel eq '20_bytes' ? 'find, names that share home slots (20 bytes)' \
                                  : 'find, spread names (32 bytes)'
    plot medians('walk', panel) with linespoints title 'slot by slot', \
         medians('std', panel) with linespoints title 'std::unordered\_map', \
         medians('absl', panel) with linespoints title 'absl::flat\_hash\_map', \
         medians('library', panel) with linespoints title 'library'
}
