/// Member names that several documents share.
///
/// They are never destroyed: a host may keep objects that save themselves in statics older than the library, and those
/// write their documents when the statics of the library are gone.
#pragma once

#include "platform/sdk/OdString.h"

namespace common::json {

// The state file.
inline OdString const& s_head = *new OdString(L"head");                           ///< "head"
inline OdString const& s_reference = *new OdString(L"reference");                 ///< "reference"
inline OdString const& s_commit = *new OdString(L"commit");                       ///< "commit"
inline OdString const& s_staged_files = *new OdString(L"staged_files");           ///< "staged_files"
inline OdString const& s_path = *new OdString(L"path");                           ///< "path"
inline OdString const& s_renames = *new OdString(L"renames");                     ///< "renames"
inline OdString const& s_new_name = *new OdString(L"new");                        ///< "new"
inline OdString const& s_previous_name = *new OdString(L"previous");              ///< "previous"
inline OdString const& s_staged_references = *new OdString(L"staged_references"); ///< "staged_references"

// Server documents. `s_ref_type` and `s_blob_path` are known to hosts; the library's own documents hold neither.
inline OdString const& s_references = *new OdString(L"references");      ///< "references"
inline OdString const& s_ref_name = *new OdString(L"name");              ///< "name"
inline OdString const& s_ref_type = *new OdString(L"type");              ///< "type"
inline OdString const& s_ref_branch_type = *new OdString(L"branch");     ///< "branch"
inline OdString const& s_ref_tag_type = *new OdString(L"tag");           ///< "tag"
inline OdString const& s_hash = *new OdString(L"hash");                  ///< "hash"
inline OdString const& s_blob_path = *new OdString(L"blob_path");        ///< "blob_path"
inline OdString const& s_storage_path = *new OdString(L"storagePath");   ///< "storagePath"
inline OdString const& s_previous_path = *new OdString(L"previousPath"); ///< "previousPath"
inline OdString const& s_parents = *new OdString(L"parentsHashes");      ///< "parentsHashes"
inline OdString const& s_annotation = *new OdString(L"annotation");      ///< "annotation"
inline OdString const& s_commitHash = *new OdString(L"commitHash");      ///< "commitHash"

} // namespace common::json
