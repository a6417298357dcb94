@echo off
rem SPDX-License-Identifier: MIT
rem Makes the Ruby engine known to all programs of this user. Needs no administrator. Undone by
rem unregister.cmd: run that before the folder is moved.
"%SystemRoot%\System32\regsvr32.exe" /s "%~dp0ruby\bin\rubyscript.dll"
if errorlevel 1 (
  echo The Ruby engine could not be registered.
  exit /b 1
)
echo The Ruby engine is registered for this user.
