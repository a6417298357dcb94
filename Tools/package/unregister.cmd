@echo off
rem SPDX-License-Identifier: MIT
rem Undoes register.cmd.
"%SystemRoot%\System32\regsvr32.exe" /s /u "%~dp0ruby\bin\rubyscript.dll"
if errorlevel 1 (
  echo The Ruby engine could not be unregistered.
  exit /b 1
)
echo The Ruby engine is no longer registered.
