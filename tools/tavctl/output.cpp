#include "tavctl/output.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "tavctl/iso_time.h"
#include "tavctl/names.h"
#include "tavctl/text.h"

namespace tavctl {
namespace {

std::string JsonString(const std::string& text) {
    std::string json = "\"";
    for (const unsigned char c : text) {
        switch (c) {
            case '"': json += "\\\""; break;
            case '\\': json += "\\\\"; break;
            case '\n': json += "\\n"; break;
            case '\r': json += "\\r"; break;
            case '\t': json += "\\t"; break;
            default:
                if (c < 0x20) {
                    char escape[8];
                    std::snprintf(escape, sizeof escape, "\\u%04x", c);
                    json += escape;
                } else {
                    json += static_cast<char>(c);
                }
        }
    }
    return json + "\"";
}

}  // namespace

Value Value::Real(double number) {
    if (!std::isfinite(number)) {
        return Null();
    }
    char text[32];
    std::snprintf(text, sizeof text, "%.17g", number);
    return {Kind::Number, text};
}

Value TextValue(BSTR text) { return text == nullptr ? Value::Null() : Value::Text(ToUtf8(text)); }

Value TimeValue(const FILETIME& time) { return Value::Text(FormatIsoUtc(time)); }

Value HresultValue(HRESULT hr) { return Value::Text(DescribeHresult(hr)); }

std::string Json(const Value& value) {
    switch (value.kind) {
        case Value::Kind::Text: return JsonString(value.text);
        case Value::Kind::Null: return "null";
        default: return value.text;
    }
}

std::string Json(const Record& record) {
    std::string json = "{";
    for (std::size_t i = 0; i < record.size(); ++i) {
        json += (i == 0 ? "" : ", ") + JsonString(record[i].first) + ": " + Json(record[i].second);
    }
    return json + "}";
}

std::string Json(const std::vector<Record>& table) {
    std::string json = "[";
    for (std::size_t i = 0; i < table.size(); ++i) {
        json += (i == 0 ? "" : ", ") + Json(table[i]);
    }
    return json + "]";
}

std::string PlainText(const Value& value) { return value.kind == Value::Kind::Null ? "(none)" : value.text; }

std::string PlainText(const Record& record) {
    std::size_t width = 0;
    for (const auto& [name, value] : record) {
        width = std::max(width, name.size());
    }
    std::string text;
    for (const auto& [name, value] : record) {
        text += (text.empty() ? "" : "\n") + name + ":" + std::string(width - name.size() + 1, ' ') + PlainText(value);
    }
    return text;
}

std::string PlainText(const std::vector<Record>& table) {
    if (table.empty()) {
        return "(none)";
    }
    std::vector<std::size_t> widths;
    for (const auto& [name, value] : table.front()) {
        widths.push_back(name.size());
    }
    for (const Record& row : table) {
        for (std::size_t i = 0; i < row.size() && i < widths.size(); ++i) {
            widths[i] = std::max(widths[i], PlainText(row[i].second).size());
        }
    }
    auto line = [&](auto cell) {
        std::string text;
        for (std::size_t i = 0; i < widths.size(); ++i) {
            std::string field = cell(i);
            if (i + 1 < widths.size()) {
                field.resize(std::max(field.size(), widths[i]), ' ');
                field += "  ";
            }
            text += field;
        }
        return text;
    };
    std::string text = line([&](std::size_t i) { return table.front()[i].first; });
    for (const Record& row : table) {
        text += "\n" + line([&](std::size_t i) { return i < row.size() ? PlainText(row[i].second) : std::string(); });
    }
    return text;
}

std::string Quote(const std::string& word) {
    constexpr std::size_t kShown = 40;
    std::string shown;
    for (std::size_t i = 0; i < word.size() && i < kShown; ++i) {
        const unsigned char c = static_cast<unsigned char>(word[i]);
        if (c < 0x20 || c == 0x7F) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\x%02X", c);
            shown += escape;
        } else {
            shown += static_cast<char>(c);
        }
    }
    if (word.size() > kShown) {
        // Do not cut a UTF-8 sequence in two.
        while (!shown.empty() && (static_cast<unsigned char>(shown.back()) & 0xC0) == 0x80) {
            shown.pop_back();
        }
        if (!shown.empty() && (static_cast<unsigned char>(shown.back()) & 0xC0) == 0xC0) {
            shown.pop_back();
        }
        return "\"" + shown + "...\" (" + std::to_string(word.size()) + " bytes)";
    }
    return "\"" + shown + "\"";
}

}  // namespace tavctl
