# Makes the table of bench/run, in Markdown, of its two files of measurements:
#   ROUND NAME MILLISECONDS              ordinary runs
#   SUBJECT, SIZE, UNIT, LAUNCHER'S MILLISECONDS, FLOOR'S MILLISECONDS, PEAK MEMORY IN MIB       growth, tab-separated

BEGIN {
  title["floor"] = "the floor: the same variables and commands, nothing else"
  title["launcher"] = "the launcher"
  title["dash"] = "the shell script under dash"
  title["bash"] = "the shell script under bash"
  print "Measured on " machine ". An ordinary launch-mode run, with programs that do nothing in the"
  print "other programs' places: medians of " rounds " rounds of " runs " runs, ratios within a round. Growth: medians of"
  print growth_runs " runs; \"for each more\" is what a further line, megabyte or argument takes above the floor.\n"
  print "| Run | Time, ms | Times the floor | For each more | Peak memory, MiB | |"
  print "|---|---|---|---|---|---|"
}

FILENAME == ARGV[1] {
  times[$2] = times[$2] " " $3
  in_round[$2, $1] = $3
  next
}

FNR == 1 {
  count = split("floor launcher dash bash", names, " ")
  for (i = 1; i <= count; ++i) ordinary_row(names[i])
  FS = "\t"
  $0 = $0
}

{ growth_row($1, $2, $3, $4, $5, $6) }

function ordinary_row(name, round, ratios, ratio, verdict) {
  for (round = 0; round < rounds; ++round) ratios = ratios " " in_round[name, round] / in_round["floor", round]
  ratio = median(ratios)
  if (name == "launcher") verdict = "target 1.10: " (ratio <= 1.10 ? "met" : "not met")
  printf "| %s | %.2f | %.2f | | | %s |\n", title[name], median(times[name]), ratio, verdict
}

# Growth is linear at most when each further line, megabyte or argument takes the launcher no longer than it did at the
# size before; a third more is allowed for the caches of the processor. What the floor takes is not the launcher's.
# There is no verdict from differences that are too short to be told from the noise.
function growth_row(subject, size, unit, time, floor, memory, above, each, verdict) {
  above = time - floor
  if (subject != last_subject) {
    last_size = last_above = last_each = 0
    first_memory = memory
  }
  if (last_size) each = (above - last_above) / (size - last_size)
  if (last_each * last_size > 0.1 * floor) verdict = each <= 4 / 3 * last_each ? "linear at most" : "more than linear"
  if (unit == "MB" && last_size) {
    verdict = joined(verdict, memory < first_memory + 0.5 ? "memory stays" : "memory grows")
  }
  if (unit == "lines" && size == 1000000) verdict = joined(verdict, "target 200 ms: " (time < 200 ? "met" : "not met"))
  printf "| %s, %s %s | %.2f | %.2f | %s | %.1f | %s |\n", subject, with_commas(size), unit, time, time / floor,
         (each > 0 ? per_unit(each, unit) : ""), memory, verdict
  last_subject = subject
  last_size = size
  last_above = above
  last_each = each
}

function joined(text, more) { return text == "" ? more : text ", " more }

function per_unit(milliseconds, unit) {
  return unit == "MB" ? sprintf("%.2f ms", milliseconds) : sprintf("%.0f ns", milliseconds * 1e6)
}

function with_commas(number, text) {
  for (text = ""; number >= 1000; number = int(number / 1000)) text = sprintf(",%03d", number % 1000) text
  return number text
}

function median(list, values, count, i, j, value) {
  count = split(list, values, " ")
  for (i = 2; i <= count; ++i) {
    value = values[i]
    for (j = i - 1; j >= 1 && values[j] + 0 > value + 0; --j) values[j + 1] = values[j]
    values[j + 1] = value
  }
  return (values[int((count + 1) / 2)] + values[int(count / 2) + 1]) / 2
}
