@echo off
rem SPDX-License-Identifier: MIT
rem Registers the Ruby engine for all programs of this user. Needs no administrator rights.
rem unregister.cmd undoes it: run that before you move the folder.
"%SystemRoot%\System32\regsvr32.exe" /s "%~dp0ruby\bin\rubyscript.dll"
if errorlevel 1 (
  echo The Ruby engine could not be registered.
  exit /b 1
)
echo The Ruby engine is registered for this user.
