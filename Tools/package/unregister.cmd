@echo off
rem SPDX-License-Identifier: MIT
rem Takes back what register.cmd has done.
"%SystemRoot%\System32\regsvr32.exe" /s /u "%~dp0ruby\bin\rubyscript.dll"
if errorlevel 1 (
  echo The Ruby engine could not be unregistered.
  exit /b 1
)
echo The Ruby engine is not registered any more.
