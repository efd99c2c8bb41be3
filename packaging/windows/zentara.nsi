; The installer of the package, for all users of a machine: scripts/package-windows runs it. VERSION is the package's,
; LISTS the folder of install.nsh and remove.nsh, which name its files one by one, KILOBYTES their size, OUTPUT the
; installer's own file.
;
; The key of the library's switches, SOFTWARE\Morvane\Zentara, is the user's: it is neither made nor removed.
Target amd64-unicode
!include LogicLib.nsh
!include WinVer.nsh

!define ENTRY "Software\Microsoft\Windows\CurrentVersion\Uninstall\Zentara"

Name "Zentara ${VERSION}"
OutFile "${OUTPUT}"
InstallDir "$PROGRAMFILES64\Zentara"
InstallDirRegKey HKLM "${ENTRY}" "InstallLocation"
RequestExecutionLevel admin
SetCompressor /SOLID lzma
AllowSkipFiles off
ManifestDPIAware true
BrandingText "Zentara ${VERSION}"

VIProductVersion "${VERSION}.0"
VIFileVersion "${VERSION}.0"
VIAddVersionKey "ProductName" "Zentara"
VIAddVersionKey "ProductVersion" "${VERSION}"
VIAddVersionKey "FileVersion" "${VERSION}"
VIAddVersionKey "FileDescription" "Installer of the Zentara camera driver library"
VIAddVersionKey "LegalCopyright" ""

Page directory
Page instfiles
UninstPage uninstConfirm
UninstPage instfiles

; Ends what has begun with code 2; nobody is asked in a silent run.
!macro StopWith text
  MessageBox MB_OK|MB_ICONSTOP "${text}" /SD IDOK
  Abort "${text}"
!macroend

Function .onInit
  ${IfNot} ${AtLeastWin7}
    MessageBox MB_OK|MB_ICONSTOP "Zentara needs Windows 7 or newer." /SD IDOK
    SetErrorLevel 2
    Quit
  ${EndIf}
FunctionEnd

; The version that is there knows its own files. It runs in place, so that it can be waited for, and stays behind itself.
Function RemoveInstalledVersion
  ReadRegStr $0 HKLM "${ENTRY}" "InstallLocation"
  ${If} $0 == ""
  ${OrIfNot} ${FileExists} "$0\uninstall.exe"
    Return
  ${EndIf}
  DetailPrint "Removing the version in $0"
  ClearErrors
  ExecWait '"$0\uninstall.exe" /S _?=$0' $2
  ${If} ${Errors}
  ${OrIf} $2 <> 0
    !insertmacro StopWith "The version in $0 cannot be removed. End the programs that use it and try again."
  ${EndIf}
  Delete "$0\uninstall.exe"
  RMDir "$0"
FunctionEnd

; What removes the files is there before the first of them.
Section
  Call RemoveInstalledVersion
  SetOutPath "$INSTDIR"
  ClearErrors
  WriteUninstaller "$INSTDIR\uninstall.exe"
  WriteRegStr HKLM "${ENTRY}" "DisplayName" "Zentara camera driver library"
  WriteRegStr HKLM "${ENTRY}" "DisplayVersion" "${VERSION}"
  WriteRegStr HKLM "${ENTRY}" "DisplayIcon" "$INSTDIR\uninstall.exe"
  WriteRegStr HKLM "${ENTRY}" "Publisher" "Morvane"
  WriteRegStr HKLM "${ENTRY}" "InstallLocation" "$INSTDIR"
  WriteRegStr HKLM "${ENTRY}" "UninstallString" '"$INSTDIR\uninstall.exe"'
  WriteRegStr HKLM "${ENTRY}" "QuietUninstallString" '"$INSTDIR\uninstall.exe" /S'
  WriteRegDWORD HKLM "${ENTRY}" "EstimatedSize" ${KILOBYTES}
  WriteRegDWORD HKLM "${ENTRY}" "NoModify" 1
  WriteRegDWORD HKLM "${ENTRY}" "NoRepair" 1
  !include "${LISTS}/install.nsh"
  ${If} ${Errors}
    !insertmacro StopWith "Not everything could be written to $INSTDIR."
  ${EndIf}
SectionEnd

; A library that a process has loaded cannot be deleted: it goes first, so that all stays or all goes. Folders go when they
; are empty: what others put there stays.
Section "Uninstall"
  SetOutPath "$TEMP"
  ClearErrors
  Delete "$INSTDIR\bin\zentara.dll"
  ${If} ${Errors}
    !insertmacro StopWith "zentara.dll cannot be deleted. End the programs that use it and try again."
  ${EndIf}
  !include "${LISTS}/remove.nsh"
  Delete "$INSTDIR\uninstall.exe"
  RMDir "$INSTDIR"
  DeleteRegKey HKLM "${ENTRY}"
SectionEnd
