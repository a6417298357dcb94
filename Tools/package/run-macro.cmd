@echo off
rem SPDX-License-Identifier: MIT
rem Runs a macro that is dropped on this file, with NAME.in beside it as input if that file exists.
rem Keeps the window open.
setlocal
if "%~1"=="" (
  echo Drop a Ruby macro, a .rbs file, on this file to run it and see its result.
  goto end
)
if not exist "%~f1" (
  echo There is no macro "%~f1".
  goto end
)
rem Runs in the folder of the macro: the code page may lack letters of its path.
pushd "%~dp1"
if exist "%~n1.in" ("%~dp0macrorun.exe" "%~nx1" "%~n1.in") else ("%~dp0macrorun.exe" "%~nx1")
popd
:end
echo.
pause
