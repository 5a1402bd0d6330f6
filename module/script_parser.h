#pragma once
#include <map>
#include <optional>
#include <string_view>
#include <vector>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

// A registry script as a tree. The text reads, for example:
//
//   HKCR
//   {
//       NoRemove CLSID
//       {
//           ForceRemove {...} = s 'Description'
//           {
//               InprocServer32 = s '%MODULE%'
//               {
//                   val ThreadingModel = s 'Both'
//               }
//           }
//       }
//   }
//
// Names are bare words or 'quoted' ('' is a quote inside a quoted text);
// keywords and root names are matched without regard to case; only string
// values ("s") exist. %NAME% is replaced by the variable's value in names and
// values, %% by a single percent sign.

enum class ScriptRoot { ClassesRoot, CurrentUser, LocalMachine };

struct ScriptEntry {
    enum class Kind { Key, NamedValue };
    Kind kind = Kind::Key;
    OleString name;
    bool noRemove = false;     // never deleted by unregistration
    bool forceRemove = false;  // subtree deleted before it is written, and by unregistration
    bool deleteKey = false;    // subtree deleted by registration, nothing written
    std::optional<OleString> value;  // a key's default value, or the named value's text
    std::vector<ScriptEntry> children;
};

struct ScriptBlock {
    ScriptRoot root;
    std::vector<ScriptEntry> entries;
};

using ScriptVariables = std::map<OleString, OleString, std::less<>>;

// A malformed script, an unknown root, keyword, value type or variable give
// HRESULT_FROM_WIN32(ERROR_INVALID_DATA) and no blocks.
HRESULT ParseRegistryScript(std::string_view text, const ScriptVariables& variables,
                            std::vector<ScriptBlock>& blocks);

}  // namespace tav
