# Makes the table of the races from lines of round, logger, row, nanoseconds, records, lost,
# malformed, what is wrong. -v racers="bare qlx ..." are the columns.
BEGIN {
  FS = "\t"
  columns = split(racers, column, " ")
  title["suppressed"] = "suppressed debug call"
  title["suppressed-inline"] = "suppressed, inline macro"
  title["text"] = "text with file, function, line"
  title["message"] = "message with string, integer, double"
  title["message-localized"] = "the same message, localized"
  title["rolling"] = "text, rolling 3 of 1 MiB"
  title["threads-2"] = "text, 2 threads"
  title["threads-8"] = "text, 8 threads"
  title["processes-4"] = "text, 4 processes, rolling"
  title["xml"] = "text as XML"
  title["trace"] = "text as trace line"
  title["xml-stamped"] = "XML with host, process, thread"
  title["trace-stamped"] = "trace line with host, process, thread"
  # The row of the others that a row is compared with, when it is not the row itself.
  rival["suppressed-inline"] = "suppressed"
  rival["message-localized"] = "message"
  # The row of the bare write: it does not roll.
  floor["rolling"] = "text"
  # Own rows, compared with an own row.
  own["xml"] = own["trace"] = own["xml-stamped"] = own["trace-stamped"] = "text"
}

{
  time[$2, $3, $1] = $4
  written[$2, $3] += $5
  lost[$2, $3] += $6
  malformed[$2, $3] += $7
  if ($8 != "") wrong[$2, $3] = $8
  if (!($3 in seen)) row[++rows] = $3
  seen[$3] = 1
  if ($1 > rounds) rounds = $1
}

# Sorts value[1..count]; its middle.
function median(count, i, j, t) {
  for (i = 2; i <= count; i++) {
    t = value[i]
    for (j = i - 1; j >= 1 && value[j] > t; j--) value[j + 1] = value[j]
    value[j + 1] = t
  }
  if (!count) return 0
  return count % 2 ? value[(count + 1) / 2] : (value[count / 2] + value[count / 2 + 1]) / 2
}

# The median of a logger in a row; the minimum is value[1] then.
function times(logger, name, i, count) {
  count = 0
  for (i = 1; i <= rounds; i++) if ((logger, name, i) in time) value[++count] = time[logger, name, i]
  return median(count)
}

# The median of the ratios of each round.
function ratio(logger, name, other, otherName, i, count) {
  count = 0
  for (i = 1; i <= rounds; i++) {
    if (!((logger, name, i) in time) || !((other, otherName, i) in time)) continue
    if (time[other, otherName, i] > 0) value[++count] = time[logger, name, i] / time[other, otherName, i]
  }
  return median(count)
}

function number(x) { return sprintf(x < 100 ? "%.1f" : "%.0f", x) }

function isRight(logger, name) {
  return !lost[logger, name] && !malformed[logger, name] && !((logger, name) in wrong)
}

function cell(logger, name, middle, text) {
  if (!((logger, name) in written)) return "-"
  middle = times(logger, name)
  text = number(value[1]) " / " number(middle)
  if (lost[logger, name] > 0)
    text = text sprintf(", **loses %.1f %%**", 100 * lost[logger, name] / written[logger, name])
  if (lost[logger, name] < 0) text = text ", **doubles records**"
  if (malformed[logger, name]) text = text ", **torn lines**"
  if ((logger, name) in wrong) text = text ", **" wrong[logger, name] "**"
  return text
}

# The logger with the least median that does the row right.
function fastest(name, i, best, least, middle) {
  best = ""
  for (i = 1; i <= columns; i++) {
    if (column[i] == "bare" || column[i] == "qlx" || column[i] == "profiled") continue
    if (!((column[i], name) in written) || !isRight(column[i], name)) continue
    middle = times(column[i], name)
    if (best == "" || middle < least) { best = column[i]; least = middle }
  }
  return best
}

function against(name, other, best) {
  if (!(("qlx", name) in written)) return "-"
  if (name in own) return sprintf("%.2f of own text", ratio("qlx", name, "qlx", own[name]))
  other = name in rival ? rival[name] : name
  best = fastest(other)
  return best == "" ? "-" : sprintf("%.2f of %s", ratio("qlx", name, best, other), best)
}

END {
  head = "| ns a record, minimum / median |"
  rule = "|---|"
  for (i = 1; i <= columns; i++) { head = head " " column[i] " |"; rule = rule "---|" }
  print head " qlx / bare | qlx / fastest |"
  print rule "---|---|"
  for (r = 1; r <= rows; r++) {
    line = "| " title[row[r]] " |"
    for (i = 1; i <= columns; i++) line = line " " cell(column[i], row[r]) " |"
    base = row[r] in floor ? floor[row[r]] : row[r] in own ? own[row[r]] : row[r]
    if (row[r] in rival) base = rival[row[r]]
    toBare = ratio("qlx", row[r], "bare", base)
    print line " " (toBare ? sprintf("%.2f", toBare) : "-") " | " against(row[r]) " |"
  }
}
