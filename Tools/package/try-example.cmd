@echo off
rem SPDX-License-Identifier: MIT
rem Shows that everything works: makes a table from a file of orders.
call "%~dp0run-macro.cmd" "%~dp0Examples\csv-to-table.rbs"
