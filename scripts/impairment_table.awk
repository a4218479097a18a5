# One markdown table from the CSV of an impairment table's runs (both modems,
# both repetition counts), as the README shows it: a row per value of the
# impairment, a column per series and repetition count, each cell the success
# rate and, when any, the wrong tokens in parentheses.
#   awk -F, -f scripts/impairment_table.awk docs/figures/impairments/tone_{dsss,dtmf}_x*.csv
FNR == 1 { next }  # Each file's header.
{
  variable = $2
  if (!($3 in seen_value)) { seen_value[$3] = 1; values[++num_values] = $3 }
  series = $4
  sub(/^48k\/16\/4/, "DSSS 48k", series)
  sub(/^44\.1k\/15\/3/, "DSSS 44.1k", series)
  sub(/^product/, "DTMF", series)
  column = series " x" $5
  if (!(column in seen_column)) { seen_column[column] = 1; columns[++num_columns] = column }
  cell = sprintf("%.0f%%", 100 * $7 / $6)
  if ($8 != "" && $8 > 0) cell = cell " (" $8 " wrong)"
  cells[$3, column] = cell
}
END {
  line = "| " variable " |"
  rule = "|---|"
  for (c = 1; c <= num_columns; ++c) { line = line " " columns[c] " |"; rule = rule "---|" }
  print line
  print rule
  for (v = 1; v <= num_values; ++v) {
    line = "| " values[v] " |"
    for (c = 1; c <= num_columns; ++c) line = line " " cells[values[v], columns[c]] " |"
    print line
  }
}
