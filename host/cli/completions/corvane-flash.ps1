# PowerShell completion for corvane-flash; printed by 'corvane-flash completion powershell'
Register-ArgumentCompleter -Native -CommandName 'corvane-flash', 'corvane-flash.exe' -ScriptBlock {
  param($wordToComplete, $commandAst, $cursorPosition)
  $quotes = '[''"`]'
  # The words up to the cursor; at a blank an empty one comes last.
  $extents = @($commandAst.CommandElements.Extent | Where-Object StartOffset -lt $cursorPosition)
  $words = @(foreach ($extent in $extents) {
      $length = [Math]::Min($extent.Text.Length, $cursorPosition - $extent.StartOffset)
      $extent.Text.Substring(0, $length) -replace $quotes
    })
  if ($extents[-1].EndOffset -lt $cursorPosition) { $words += '' }
  $typed = $words[-1]
  # PowerShell takes words apart at commas, and replaces the last part alone.
  $part = $wordToComplete -replace $quotes
  $cut = if ($typed.EndsWith($part)) { $typed.Length - $part.Length } else { 0 }

  # Older PowerShells leave out empty words and take the answer for text of another code page, so
  # the tool isn't called by &.
  $tool = Get-Command $commandAst.GetCommandName() -CommandType Application | Select-Object -First 1
  $start = New-Object Diagnostics.ProcessStartInfo $tool.Source
  $start.Arguments = 'completion words --'
  foreach ($word in $words | Select-Object -Skip 1) {
    $start.Arguments += ' "' + ($word -replace '(\\+)$', '$1$1') + '"'
  }
  $start.WorkingDirectory = (Get-Location -PSProvider FileSystem).ProviderPath
  $start.UseShellExecute = $false
  $start.RedirectStandardOutput = $start.RedirectStandardError = $true
  $start.StandardOutputEncoding = [Text.Encoding]::UTF8
  $answer = [Diagnostics.Process]::Start($start).StandardOutput.ReadToEnd()

  $offered = foreach ($line in $answer -split "`n") {
    $word, $help = $line -split "`t", 2
    if ($word -eq ':files') {
      foreach ($file in [Management.Automation.CompletionCompleters]::CompleteFilename($typed.Substring($help.Length))) {
        $text = ($help + $file.CompletionText).Substring([Math]::Min($cut, $help.Length))
        New-Object Management.Automation.CompletionResult $text, $file.ListItemText, $file.ResultType, $file.ToolTip
      }
    } elseif ($word -and $word.StartsWith($typed, [StringComparison]::Ordinal)) {
      $text = $word.Substring($cut)
      if ($text -match '[^\w,=:./+-]') { $text = "'" + $text.Replace("'", "''") + "'" }
      $meaning = if ($help) { $help } else { $word }
      New-Object Management.Automation.CompletionResult $text, $word, 'ParameterValue', $meaning
    }
  }
  # Without an answer PowerShell would offer files.
  if ($offered) { $offered } else { '' }
}
