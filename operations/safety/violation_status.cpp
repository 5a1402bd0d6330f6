// The last safety violation of a drive module: what was violated, where the
// axes, the tool centre point and the flange were, and which supervision
// functions were in violation or active.
//
// The reply has a fixed head, then arrays found by their keys, each written
// "-<key> <count>[" and its elements: numbers ended by a comma, or flags of
// one character each.
#include <span>

#include "core/controller_object.h"
#include "core/keyed_text.h"
#include "core/text/format.h"

namespace tav {
namespace {

constexpr WordValue<TavVantorViolationType> kViolationTypeWords[] = {
    {OLESTR("none"), TavVantorViolationTypeNone},
    {OLESTR("stz"), TavVantorViolationTypeSTZ},
    {OLESTR("sar"), TavVantorViolationTypeSAR},
    {OLESTR("sts"), TavVantorViolationTypeSTS},
    {OLESTR("sas"), TavVantorViolationTypeSAS},
    {OLESTR("tom"), TavVantorViolationTypeTOM},
    {OLESTR("osr"), TavVantorViolationTypeOSR},
    {OLESTR("sst"), TavVantorViolationTypeSST},
    {OLESTR("red_tool_speed"), TavVantorViolationTypeReducedToolSpeed},
    {OLESTR("red_axis_speed"), TavVantorViolationTypeReducedAxisSpeed},
    {OLESTR("unsync_speed_lim"), TavVantorViolationTypeUnsynchSpeed},
    {OLESTR("empstop"), TavVantorViolationTypeEMSTOP},
    {OLESTR("other"), TavVantorViolationTypeOther}};

// One array of the caller's: its capacity, where the reply's count goes, and
// the elements.
template <class Element>
struct ArrayOut {
    LONG capacity;
    LONG* count;
    Element* elements;
};

using Numbers = ArrayOut<double>;
using Flags = ArrayOut<LONG>;

std::size_t Room(LONG capacity) { return capacity > 0 ? static_cast<std::size_t>(capacity) : 0; }

// The configuration decoder's text, which clients know for every array.
constexpr const OLECHAR* kNoArray = OLESTR("UnpackSafetyConfigurationInfo failed no axes.");

// The count the reply writes; for a missing key, the failure recorded, in
// its place.
template <class Element, class Read>
LONG ReadArray(Reply& reply, OleStringView key, const ArrayOut<Element>& out, Read read) {
    const std::size_t at = reply.Find(key);
    if (at == OleStringView::npos) {
        return reply.Fail(E_FAIL, kNoArray);
    }
    const std::optional<ArrayRead> array =
        read(reply.Text().substr(at), std::span<Element>(out.elements, Room(out.capacity)));
    return array ? array->count : 0;
}

}  // namespace

HRESULT ControllerObject::GetSafetyViolationStatus(
    TavInParams* rip, LONG driveModuleIndex, LONG lastViolation, LONG cAxes, LONG* nAxes, double* axes, LONG cSpeeds,
    LONG* nSpeeds, double* speeds, LONG cTcp, LONG* nTcp, double* tcp, LONG cFlange, LONG* nFlange, double* flange,
    LONG cOrientation, LONG* nOrientation, double* orientation, ULONG* number, TavVantorViolationType* type,
    ULONG* instance, LONG* synchronized, short* tool, short* drive, LONG cSsv, LONG* nSsv, LONG* ssv, LONG cUpperArm,
    LONG* nUpperArm, LONG* upperArm, LONG cToolPosition, LONG* nToolPosition, LONG* toolPosition,
    LONG cToolPositionActive, LONG* nToolPositionActive, LONG* toolPositionActive, LONG cToolSpeed, LONG* nToolSpeed,
    LONG* toolSpeed, LONG cToolSpeedActive, LONG* nToolSpeedActive, LONG* toolSpeedActive, LONG cAxisRange,
    LONG* nAxisRange, LONG* axisRange, LONG cAxisRangeActive, LONG* nAxisRangeActive, LONG* axisRangeActive) {
    return Command(rip)
        .ValidParams(OLESTR("GetLastSafetyViolation - Invalid argument."))
        .Initialised(OLESTR("GetLastSafetyViolation used before Initialized"))
        .Get(OLESTR("VantorViolationInfo"),
             text::Format(OLESTR("-driver_module %d -last_violation %d"), driveModuleIndex, lastViolation))
        .Decode([&](VARIANT* reply) {
            return UnpackSafetyViolationStatus(
                reply, cAxes, nAxes, axes, cSpeeds, nSpeeds, speeds, cTcp, nTcp, tcp, cFlange, nFlange, flange,
                cOrientation, nOrientation, orientation, number, type, instance, synchronized, tool, drive, cSsv, nSsv,
                ssv, cUpperArm, nUpperArm, upperArm, cToolPosition, nToolPosition, toolPosition, cToolPositionActive,
                nToolPositionActive, toolPositionActive, cToolSpeed, nToolSpeed, toolSpeed, cToolSpeedActive,
                nToolSpeedActive, toolSpeedActive, cAxisRange, nAxisRange, axisRange, cAxisRangeActive,
                nAxisRangeActive, axisRangeActive);
        });
}

HRESULT ControllerObject::UnpackSafetyViolationStatus(
    VARIANT* data, LONG cAxes, LONG* nAxes, double* axes, LONG cSpeeds, LONG* nSpeeds, double* speeds, LONG cTcp,
    LONG* nTcp, double* tcp, LONG cFlange, LONG* nFlange, double* flange, LONG cOrientation, LONG* nOrientation,
    double* orientation, ULONG* number, TavVantorViolationType* type, ULONG* instance, LONG* synchronized, short* tool,
    short* drive, LONG cSsv, LONG* nSsv, LONG* ssv, LONG cUpperArm, LONG* nUpperArm, LONG* upperArm,
    LONG cToolPosition, LONG* nToolPosition, LONG* toolPosition, LONG cToolPositionActive, LONG* nToolPositionActive,
    LONG* toolPositionActive, LONG cToolSpeed, LONG* nToolSpeed, LONG* toolSpeed, LONG cToolSpeedActive,
    LONG* nToolSpeedActive, LONG* toolSpeedActive, LONG cAxisRange, LONG* nAxisRange, LONG* axisRange,
    LONG cAxisRangeActive, LONG* nAxisRangeActive, LONG* axisRangeActive) {
    // In the order of the parameters; the reply's keys for the flags follow
    // their own order.
    const std::pair<const OLECHAR*, Numbers> numbers[] = {
        {OLESTR("-axes"), {cAxes, nAxes, axes}},
        {OLESTR("-speed"), {cSpeeds, nSpeeds, speeds}},
        {OLESTR("-tcp"), {cTcp, nTcp, tcp}},
        {OLESTR("-fpos"), {cFlange, nFlange, flange}},
        {OLESTR("-forient"), {cOrientation, nOrientation, orientation}},
    };
    const std::pair<const OLECHAR*, Flags> flags[] = {
        {OLESTR("-ssv"), {cSsv, nSsv, ssv}},
        {OLESTR("-uarmvs"), {cUpperArm, nUpperArm, upperArm}},
        {OLESTR("-toolposvs"), {cToolPosition, nToolPosition, toolPosition}},
        {OLESTR("-toolposas"), {cToolPositionActive, nToolPositionActive, toolPositionActive}},
        {OLESTR("-toolspeedvs"), {cToolSpeed, nToolSpeed, toolSpeed}},
        {OLESTR("-toolspeedas"), {cToolSpeedActive, nToolSpeedActive, toolSpeedActive}},
        {OLESTR("-axisrangevs"), {cAxisRange, nAxisRange, axisRange}},
        {OLESTR("-axisrangeas"), {cAxisRangeActive, nAxisRangeActive, axisRangeActive}},
    };
    return Decode(data)
        .Initialised()
        .NotNull(OLESTR("UnpackLastSafetyViolation. NULL data-variant"))
        .OutPointers(OLESTR("UnpackLastSafetyViolation. Invalid out pointer"), nAxes, axes, nSpeeds, speeds, nTcp,
                     tcp, nFlange, flange, nOrientation, orientation, number, type, instance, synchronized, tool,
                     drive, nSsv, ssv, nUpperArm, upperArm, nToolPosition, toolPosition, nToolPositionActive,
                     toolPositionActive, nToolSpeed, toolSpeed, nToolSpeedActive, toolSpeedActive, nAxisRange,
                     axisRange, nAxisRangeActive, axisRangeActive)
        .IsBstr(OLESTR("UnpackLastSafetyViolation. Invalid argument."))
        .Then([&](Reply& reply) {
            const HRESULT head = reply.Fields<OLESTR(
                "-vnumber %d -violationtype %s -instanceid %d -isunsync %d -tool %d -drive %d")>(
                OLESTR("UnpackLastSafetyViolation failed."), number,
                fields::MappedOr<TavVantorViolationType>{type, kViolationTypeWords, TavVantorViolationTypeUndefined},
                instance, synchronized, tool, drive);
            if (FAILED(head)) {
                return head;
            }
            for (const auto& [key, out] : numbers) {
                *out.count = ReadArray(reply, ViewOf(key), out, ReadNumberArray);
            }
            for (const auto& [key, out] : flags) {
                *out.count = ReadArray(reply, ViewOf(key), out, ReadFlagArray);
            }
            return S_OK;
        });
}

}  // namespace tav
