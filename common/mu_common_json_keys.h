/// Member names that several documents share.
#pragma once

#include "platform/sdk/OdString.h"

namespace common::json {

// The state file.
inline OdString const s_head = L"head";                           ///< "head"
inline OdString const s_reference = L"reference";                 ///< "reference"
inline OdString const s_commit = L"commit";                       ///< "commit"
inline OdString const s_staged_files = L"staged_files";           ///< "staged_files"
inline OdString const s_path = L"path";                           ///< "path"
inline OdString const s_renames = L"renames";                     ///< "renames"
inline OdString const s_new_name = L"new";                        ///< "new"
inline OdString const s_previous_name = L"previous";              ///< "previous"
inline OdString const s_staged_references = L"staged_references"; ///< "staged_references"

// Server documents. `s_ref_type` and `s_blob_path` are known to hosts; the library's own documents hold neither.
inline OdString const s_references = L"references";      ///< "references"
inline OdString const s_ref_name = L"name";              ///< "name"
inline OdString const s_ref_type = L"type";              ///< "type"
inline OdString const s_ref_branch_type = L"branch";     ///< "branch"
inline OdString const s_ref_tag_type = L"tag";           ///< "tag"
inline OdString const s_hash = L"hash";                  ///< "hash"
inline OdString const s_blob_path = L"blob_path";        ///< "blob_path"
inline OdString const s_storage_path = L"storagePath";   ///< "storagePath"
inline OdString const s_previous_path = L"previousPath"; ///< "previousPath"
inline OdString const s_parents = L"parentsHashes";      ///< "parentsHashes"
inline OdString const s_annotation = L"annotation";      ///< "annotation"
inline OdString const s_commitHash = L"commitHash";      ///< "commitHash"

} // namespace common::json
