# What a record took, as a line of a table: from two files of callgrind, written with names and
# positions in full, of `few` and of `many` records. `row` names the record.

function groupOf(object) {
  if (object ~ /\/libqlx\./) return "qlx"
  if (object ~ /\/libicu/) return "icu"
  if (object ~ /\/libc\./) return "c"
  return "rest"
}

function isAllocation(name) {
  sub(/'.*/, "", name)  # a call within a call
  return name ~ /^(malloc|calloc|realloc|reallocarray|memalign|aligned_alloc|posix_memalign)$/
}

FNR == 1 { file++ }
/^ob=/ { group = groupOf(substr($0, 4)) }
/^fn=/ { caller = substr($0, 4) }
/^cfn=/ { called = substr($0, 5) }

# The line after it has the cost of what is called, which is counted there.
/^calls=/ {
  if (isAllocation(called) && !isAllocation(caller))
    blocks[file] += substr($1, 7)
  getline
  next
}

/^[0-9]+ [0-9]+$/ {
  cost[file, group] += $2
  cost[file, "all"] += $2
}

function each(name) { return (cost[2, name] - cost[1, name]) / (many - few) }

END {
  printf "| %s | %.0f | %.0f | %.0f | %.0f | %.0f | %.2f |\n", row, each("all"), each("qlx"),
    each("icu"), each("c"), each("rest"), (blocks[2] - blocks[1]) / (many - few)
}
