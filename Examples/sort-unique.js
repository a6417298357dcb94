// sort-unique: sorts the lines and keeps one of each.
//
// A macro should read all that it needs before it changes lines: every change moves the numbers of
// the lines behind it.

var lines = [];
for (var line = 1; line <= tarn.line_count(); line++) lines.push(tarn.get_line(line));

// The default order compares character by character, so capitals stand before small letters and
// accented letters behind both.
lines.sort();

var kept = 0;
for (var i = 0; i < lines.length; i++) {
  if (i > 0 && lines[i] == lines[i - 1]) continue;
  kept++;
  tarn.set_line(kept, lines[i]);
}

// What is left over stands at the end. Delete from behind: the other numbers then stay right.
for (var surplus = lines.length; surplus > kept; surplus--) tarn.delete_line(surplus);
tarn.message("sort-unique: kept", kept, "of", lines.length, "lines");
