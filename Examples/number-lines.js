// number-lines: writes each line's number in front of it.
//
// Lines count from 1. get_line gives a line without its line end and set_line leaves the line end as
// it is, so a text with CRLF line ends keeps them.

function padded(number, width) {
  var text = String(number);
  while (text.length < width) text = " " + text;
  return text;
}

var count = tarn.line_count();
var width = String(count).length;
for (var line = 1; line <= count; line++) {
  tarn.set_line(line, padded(line, width) + ": " + tarn.get_line(line));
}
