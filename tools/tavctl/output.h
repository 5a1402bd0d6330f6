#pragma once
#include <string>
#include <utility>
#include <vector>

#include "tav/platform.h"

namespace tavctl {

// One printed value: a text, a number, a truth value or nothing. Scripts
// read them with --json, people without.
struct Value {
    enum class Kind { Text, Number, Boolean, Null };
    Kind kind = Kind::Null;
    std::string text;

    static Value Text(std::string text) { return {Kind::Text, std::move(text)}; }
    static Value Number(long long number) { return {Kind::Number, std::to_string(number)}; }
    static Value Unsigned(unsigned long long number) { return {Kind::Number, std::to_string(number)}; }
    static Value Real(double number);
    static Value Boolean(bool truth) { return {Kind::Boolean, truth ? "true" : "false"}; }
    static Value Null() { return {}; }
};

Value TextValue(BSTR text);  // NULL is Null
Value TimeValue(const FILETIME& time);
Value HresultValue(HRESULT hr);

// Named values in the order they are printed.
using Record = std::vector<std::pair<std::string, Value>>;

// JSON text of a value, a record (an object) and a list of records (an array).
std::string Json(const Value& value);
std::string Json(const Record& record);
std::string Json(const std::vector<Record>& table);

// Plain text: a value as it is; a record as "name: value" lines; a table
// with a header line and aligned columns (the first record's names).
std::string PlainText(const Value& value);
std::string PlainText(const Record& record);
std::string PlainText(const std::vector<Record>& table);

// Words of the command line quoted back in a message: long ones cut, control
// characters escaped, so that a message stays on one line.
std::string Quote(const std::string& word);

}  // namespace tavctl
