/* The Analysis Workspace: a preallocated arena that serves the scratch memory of every routine
 * while it is enabled. Set-up calls must not run beside analysis calls. */
#ifndef TWANLYS_WORKSPACE_H
#define TWANLYS_WORKSPACE_H

#include "twanlys/types.h"

/* Reserves `bytes` bytes (0: the same as UninitializeAnalysisWorkspaceH). */
TW_API int32_t InitializeAnalysisWorkspaceH(int32_t bytes, ErrorCluster* error);
TW_API int32_t EnableAnalysisWorkspaceH(ErrorCluster* error);
TW_API int32_t DisableAnalysisWorkspaceH(ErrorCluster* error);
TW_API int32_t UninitializeAnalysisWorkspaceH(ErrorCluster* error);

#endif
