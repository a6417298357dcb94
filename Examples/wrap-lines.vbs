' wrap-lines: breaks lines of more than 60 characters at blanks.
'
' A word of more than 60 characters stays whole. A line that begins with blanks is left alone: it may
' be a listing or a table.
Option Explicit

Const width = 60

' Where to break a text that is too long; 0 when it has no blank to break at.
Function BreakPosition(text)
  BreakPosition = InStrRev(text, " ", width + 1)
  If BreakPosition = 0 Then BreakPosition = InStr(text, " ")
End Function

Dim line, text, position
line = 1
Do While line <= tarn.line_count()
  text = tarn.get_line(line)
  position = 0
  If Len(text) > width And Left(text, 1) <> " " Then position = BreakPosition(text)
  If position > 0 Then
    ' The rest becomes the next line, whose turn comes next.
    tarn.set_line line, Left(text, position - 1)
    tarn.insert_line line + 1, Mid(text, position + 1)
  End If
  line = line + 1
Loop
