@echo off
rem SPDX-License-Identifier: MIT
rem Runs a macro that is dropped on this file, over NAME.in beside it if there is
rem one, and keeps the window open.
setlocal
if "%~1"=="" (
  echo Drop a Ruby macro, a .rbs file, on this file: it is run and its text is shown.
  goto end
)
if not exist "%~f1" (
  echo There is no macro "%~f1".
  goto end
)
rem A macro is named from its own folder: its path may hold letters that the code page has not.
pushd "%~dp1"
if exist "%~n1.in" ("%~dp0macrorun.exe" "%~nx1" "%~n1.in") else ("%~dp0macrorun.exe" "%~nx1")
popd
:end
echo.
pause
