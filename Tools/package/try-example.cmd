@echo off
rem SPDX-License-Identifier: MIT
rem A double click shows that everything works: a table made from a file of orders.
call "%~dp0run-macro.cmd" "%~dp0Examples\csv-to-table.rbs"
