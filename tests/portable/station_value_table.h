// A station key held in memory for the portable tests and the fuzzer: values of any type and
// bytes, read with the registry's buffer rule, and a record of the names asked for.
#pragma once

#include <cstdint>
#include <vector>

#include "stations/portable/station_values.h"
#include "support/portable/byte_io.h"

class StationValueTable final : public StationValueSource {
public:
    struct Value {
        WideString name;
        RegistryValueType type = RegistryValueType::kNone;
        std::vector<uint8_t> data;
        ValueReadStatus refusal = ValueReadStatus::kRead;  // anything else: the read is refused
    };

    // Replaces a value of the same name, as the registry keeps one; a refusal goes with it.
    void Set(WideStringView name, RegistryValueType type, std::vector<uint8_t> data) {
        Value* value = Find(name);
        if (!value)
            value =
                &values_.emplace_back(Value{WideString(name), type, {}, ValueReadStatus::kRead});
        value->type = type;
        value->data = std::move(data);
        value->refusal = ValueReadStatus::kRead;
    }

    // A text with its terminator, as the store writes one.
    void SetText(WideStringView name, WideStringView text) {
        std::vector<uint8_t> bytes;
        AppendWideZ(bytes, text);
        Set(name, RegistryValueType::kText, std::move(bytes));
    }

    void SetNumber(WideStringView name, uint32_t number) {
        std::vector<uint8_t> bytes;
        AppendU32(bytes, number);
        Set(name, RegistryValueType::kNumber, std::move(bytes));
    }

    void Remove(WideStringView name) {
        std::erase_if(values_, [&](const Value& value) { return value.name == name; });
    }

    void Refuse(WideStringView name, ValueReadStatus refusal) {
        if (Value* value = Find(name))
            value->refusal = refusal;
    }

    ValueReadStatus ReadValue(const WideChar* name, size_t capacity, RegistryValueType& type,
                              std::vector<uint8_t>& data) override {
        asked_.emplace_back(name);
        data.clear();
        const Value* value = Find(name);
        if (!value)
            return ValueReadStatus::kMissing;
        if (value->refusal != ValueReadStatus::kRead)
            return value->refusal;
        if (value->data.size() > capacity)
            return ValueReadStatus::kTooLong;
        type = value->type;
        // A fresh vector of exactly the value's size: a read past it is an overflow for ASan.
        data = std::vector<uint8_t>(value->data.begin(), value->data.end());
        return ValueReadStatus::kRead;
    }

    const std::vector<WideString>& Asked() const noexcept { return asked_; }

private:
    Value* Find(WideStringView name) {
        for (Value& value : values_)
            if (value.name == name)
                return &value;
        return nullptr;
    }

    std::vector<Value> values_;
    std::vector<WideString> asked_;
};
