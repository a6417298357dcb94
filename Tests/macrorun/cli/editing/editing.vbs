' SPDX-License-Identifier: MIT
' The same result as editing.js. Variables pass by reference, so their numbers arrive as texts.
Dim n, s
n = 1: s = "[1]"
tarn.write s
tarn.goto_line 2.0
s = "[2]" & vbCrLf & "split|": tarn.write s
s = "inserted": tarn.insert_line n, s
tarn.write "[2]"
tarn.delete_line 2
tarn.write "[3]"
n = 3: s = "x": tarn.set_line n, s
tarn.write "y"
tarn.delete_line n
tarn.write "[4]" & vbLf
tarn.goto_line tarn.line_count() + 1
tarn.write "end"
tarn.WRITE "ing" & vbLf
tarn.write tarn.line_count() & " lines" & vbLf
n = tarn.line_count() + 1: tarn.insert_line n, -2.5
tarn.message "done"
