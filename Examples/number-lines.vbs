' number-lines: writes each line's number in front of it.
'
' Lines count from 1. get_line gives a line without its line end and set_line leaves the line end as
' it is, so a text with CRLF line ends keeps them.
Option Explicit

Function Padded(number, width)
  Padded = CStr(number)
  While Len(Padded) < width
    Padded = " " & Padded
  Wend
End Function

Dim count, width, line
count = tarn.line_count()
width = Len(CStr(count))
For line = 1 To count
  tarn.set_line line, Padded(line, width) & ": " & tarn.get_line(line)
Next
