// Where the brackets of the texts being expanded close, remembered once expansions nest deeply.
//
// Finding the end of a block means scanning it up to its closing bracket, so a block nested in n others is
// scanned n times, once by each enclosing directive: quadratic in the depth. Each running expansion holds a
// BracketScope over its text. From kRecordFromDepth nested scopes on, a scan for a closing bracket records
// where every bracket of its kind that it passes closes, in the outermost scope whose text holds the bracket,
// and later scans of a block inside that text find their end there at once. The text of a running expansion
// stays alive and unchanged until its scope ends, so nothing recorded outlives the text it describes; at
// shallow depths nothing is recorded and nothing allocated.
#pragma once

#include <memory>
#include <unordered_map>

#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/lexer/token.h"

namespace orvan {

class BracketScope {
public:
    explicit BracketScope(BasicSubString text);
    ~BracketScope();
    BracketScope(const BracketScope&) = delete;
    BracketScope& operator=(const BracketScope&) = delete;

    // Deep enough that a few levels of real nesting never record.
    static constexpr int kRecordFromDepth = 12;
    // Whether scans on this thread record the brackets they pass.
    static bool Recording();
    // The closing token recorded for the opening bracket whose token ends at `afterOpen`, and the end of the
    // last token inside the brackets (afterOpen when there is none); false if none is recorded.
    static bool FindClose(const char* afterOpen, LSToken& close, const char*& insideEnd);
    static void RecordClose(const char* afterOpen, const LSToken& close, const char* insideEnd);

private:
    static BracketScope* OutermostHolding(const char* p);

    BasicSubString text_;
    BracketScope* parent_;
    int depth_;
    struct Close {
        LSToken token;
        const char* insideEnd;
    };
    std::unique_ptr<std::unordered_map<const char*, Close>> closes_;  // made on the first record
};

}  // namespace orvan
