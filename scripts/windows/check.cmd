@echo off
rem Tests the programs and the DLL on this machine and prints one line for each check, "ok" or "FAIL". Installs and
rem changes nothing. No window should open.
rem
rem usage: check.cmd [quick]
rem   quick  skips the unit tests and the failures at every step, which take minutes
setlocal
set here=%~dp0
set host="%here%assay-host.exe"
set child="%here%check\test_child.exe"
set log="%TEMP%\assay-check.log"
rem For the DLL, which is beside assay.exe.
set PATH=%here%;%PATH%
set failed=0
echo assay-check >%log%

set command=%host% --version
call :check 0 "assay-host starts"
set command=%host% run
call :check 0 "assay prints a whole report"
set command=%host% run -- -bogus
call :check 2 "a usage error is reported"
set command=%host% run -- "-stdout=a b\" -exit=5 "-comment=c"
call :check 0 "options reach assay unchanged"
set command="%here%check\decide_c.exe"
call :check 0 "an application decides by the DLL"

for %%h in (access-violation fast-fail stack-overflow) do call :crash %%h
set command=%host% run --assay %child% --timeout 5 -- die hang
call :check 4 "a child that hangs is killed and reported"
set command=%host% run --assay %child% --timeout 60 -- die exit
call :check 1 "a child that ends early is reported"

if "%1"=="quick" goto end
set command=%host% torture
call :check 0 "a failure at every step is as predicted"
pushd "%here%check"
for %%t in (*_tests.exe) do call :unit %%t
popd

:end
if %failed%==0 (echo All checks passed.) else (echo Some checks failed; see %log%.)
exit /b %failed%

:crash
set command=%host% run --assay %child% --timeout 60 -- die %1
call :check 3 "a crash is reported: %1"
goto :eof

:unit
set command="%here%check\%1" --gtest_brief=1
call :check 0 "unit tests: %1"
goto :eof

rem Runs the command. The first argument is the expected status, the second the text of the check.
:check
echo == %~2 >>%log%
%command% >>%log% 2>&1 <nul
set status=%errorlevel%
echo status %status% >>%log%
if %status%==%1 (
    echo ok    %~2
) else (
    echo FAIL  %~2: status %status% instead of %1
    set failed=1
)
goto :eof
