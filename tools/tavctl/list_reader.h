#pragma once
#include <functional>
#include <vector>

#include "tavctl/verb.h"

namespace tavctl {

// A list operation (Get with TavRetrievalParams and an enumerator, then its
// Unpack with --async), printed as a table of what the enumerator hands
// out. `row` turns an element into a record and frees what it owns;
// `prepare` may sort or filter the enumerator first.
template <typename Enum, typename Element, typename Get, typename Unpack, typename Row>
int ReadList(Verb& v, const char* operation, long retrieveAll, Get get, Unpack unpack, Row row,
             const std::function<HRESULT(Enum*)>& prepare = {}) {
    TavRetrievalParams params{};
    params.noOfElts = retrieveAll;
    tav::ComPtr<Enum> elements;
    const int status = v.session.Read(
        operation,
        [&](TavInParams* rip) {
            params = TavRetrievalParams{};
            params.noOfElts = retrieveAll;
            return get(rip, &params, &elements);
        },
        [&](VARIANT* data) {
            params = TavRetrievalParams{};
            params.noOfElts = retrieveAll;
            return unpack(data, &params, &elements);
        },
        [] {});
    if (status != kExitOk) {
        return status;
    }
    if (!elements) {
        v.session.Show(std::vector<Record>{});
        return kExitOk;
    }
    if (prepare) {
        if (const HRESULT hr = prepare(elements.Get()); FAILED(hr)) {
            return v.session.Fail(std::string(operation) + ": preparing the list", hr);
        }
    }
    std::vector<Record> table;
    for (;;) {
        Element element{};
        ULONG fetched = 0;
        const HRESULT hr = elements->RemNext(1, &element, &fetched);
        if (FAILED(hr)) {
            return v.session.Fail(std::string(operation) + ": RemNext", hr);
        }
        if (hr != S_OK || fetched != 1) {
            break;
        }
        table.push_back(row(element));
    }
    v.session.Show(table);
    return kExitOk;
}

}  // namespace tavctl
