// wrap-lines: breaks lines of more than 60 characters at blanks.
//
// A word of more than 60 characters stays whole. A line that begins with blanks is left alone: it may
// be a listing or a table.

var width = 60;

// Where to break a text that is too long; 0 when it has no blank to break at.
function breakPosition(text) {
  var position = text.lastIndexOf(" ", width);
  return position > 0 ? position : Math.max(text.indexOf(" "), 0);
}

var line = 1;
while (line <= tarn.line_count()) {
  var text = tarn.get_line(line);
  var position = text.length > width && text.charAt(0) != " " ? breakPosition(text) : 0;
  if (position > 0) {
    // The rest becomes the next line, whose turn comes next.
    tarn.set_line(line, text.substring(0, position));
    tarn.insert_line(line + 1, text.substring(position + 1));
  }
  line++;
}
