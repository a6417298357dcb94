' sort-unique: sorts the lines and keeps one of each.
'
' A macro should read all that it needs before it changes lines: every change moves the numbers of
' the lines behind it.
Option Explicit

Dim count, kept, line, sorted
count = tarn.line_count()
ReDim sorted(count + 1)

' Inserts text into the sorted entries 1 to kept, unless it is among them. StrComp with 0 compares
' character by character, so capitals stand before small letters and accented letters behind both.
Sub Keep(text)
  Dim place, i
  place = kept + 1
  Do While place > 1
    If StrComp(sorted(place - 1), text, 0) = 0 Then Exit Sub
    If StrComp(sorted(place - 1), text, 0) < 0 Then Exit Do
    place = place - 1
  Loop
  For i = kept To place Step -1
    sorted(i + 1) = sorted(i)
  Next
  sorted(place) = text
  kept = kept + 1
End Sub

kept = 0
For line = 1 To count
  Keep tarn.get_line(line)
Next

For line = 1 To kept
  tarn.set_line line, sorted(line)
Next

' What is left over stands at the end. Delete from behind: the other numbers then stay right.
For line = count To kept + 1 Step -1
  tarn.delete_line line
Next
tarn.message "sort-unique: kept", kept, "of", count, "lines"
