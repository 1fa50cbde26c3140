// Small growable array of plain values (32-bit integers or 8-byte reals) that callers
// hand to the service functions: depth bounds, thicknesses, class limits, lists of kinds.
#pragma once

#include <algorithm>
#include <cstddef>
#include <initializer_list>
#include <type_traits>

template <typename T>
class CZodEVIValueArray {
    static_assert(std::is_trivially_copyable_v<T>, "plain values only");

public:
    CZodEVIValueArray() = default;
    explicit CZodEVIValueArray(int growBy) : growBy_(growBy > 0 ? growBy : 8) {}
    CZodEVIValueArray(std::initializer_list<T> values)
    {
        for (const T& v : values)
            Add(v);
    }
    CZodEVIValueArray(const CZodEVIValueArray& other) { *this = other; }
    CZodEVIValueArray& operator=(const CZodEVIValueArray& other)
    {
        if (this != &other) {
            SetSize(other.count_);
            std::copy(other.data_, other.data_ + other.count_, data_);
        }
        return *this;
    }
    ~CZodEVIValueArray() { delete[] data_; }

    int GetSize() const { return count_; }
    bool IsEmpty() const { return count_ == 0; }
    const T* GetData() const { return data_; }
    T* GetData() { return data_; }
    T& operator[](int i) { return data_[i]; }
    const T& operator[](int i) const { return data_[i]; }
    const T* begin() const { return data_; }
    const T* end() const { return data_ + count_; }

    // Appends and answers the new element's index.
    int Add(const T& value)
    {
        const T copy = value; // value may live in our own storage
        SetSize(count_ + 1);
        data_[count_ - 1] = copy;
        return count_ - 1;
    }

    // Shifts the tail up by one; an index past the end grows the array with zeroes.
    void InsertAt(int index, const T& value)
    {
        if (index < 0)
            index = 0;
        const T copy = value;
        if (index >= count_) {
            SetSize(index + 1);
        } else {
            SetSize(count_ + 1);
            std::copy_backward(data_ + index, data_ + count_ - 1, data_ + count_);
        }
        data_[index] = copy;
    }

    // Sets the count, growing to the larger of n and capacity plus the growth step.
    void SetSize(int n)
    {
        if (n < 0)
            n = 0;
        if (n > capacity_) {
            const int capacity = std::max(n, capacity_ + growBy_);
            T* grown = new T[static_cast<std::size_t>(capacity)]();
            std::copy(data_, data_ + count_, grown);
            delete[] data_;
            data_ = grown;
            capacity_ = capacity;
        }
        for (int i = count_; i < n; ++i)
            data_[i] = T();
        count_ = n;
    }

    void RemoveAll() { count_ = 0; }

private:
    T* data_ = nullptr;
    int capacity_ = 0;
    int count_ = 0;
    int growBy_ = 8;
};
