// SPDX-License-Identifier: MIT
// Every function that edits, and where each leaves the cursor.
tarn.write("[1]");                 // at the start of the text
tarn.goto_line(2.0);
tarn.write("[2]\nsplit|");         // a line end in the middle of a line
tarn.insert_line(1, "inserted");   // the cursor stays with its text
tarn.write("[2]");
tarn.delete_line(2);               // so it does here
tarn.write("[3]");
tarn.set_line(3, "x");             // and here it moves to the shorter line's end
tarn.write("y");
tarn.delete_line(3);               // its own line: to the start of the next
tarn.write("[4]\r\n");
tarn.goto_line(tarn.line_count() + 1);
tarn.write("end");                 // begins a line, and this one has no line end
tarn.WRITE("ing\n");               // now it has
tarn.write(tarn.line_count() + " lines\n");
tarn.insert_line("8", -2.5);
tarn.message("done", 1, 2.5);
