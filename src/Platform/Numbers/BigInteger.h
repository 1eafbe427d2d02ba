// Integers of any size: the seam to GMP.
#pragma once

#include <gmp.h>

#include <cstdint>
#include <string>
#include <string_view>

namespace xquery {

class BigInteger {
 public:
  BigInteger() { mpz_init(_value); }
  BigInteger(int64_t value) { mpz_init_set_si(_value, value); }
  static BigInteger fromUnsigned(uint64_t value);
  static BigInteger fromHalves(uint64_t high, uint64_t low);
  __extension__ using Wide = __int128;
  static BigInteger fromWide(Wide value);
  // Decimal digits only.
  static BigInteger fromDigits(const std::string& digits);
  static BigInteger power(uint32_t base, uint32_t exponent);
  static BigInteger powerOfTen(uint32_t exponent) { return power(10, exponent); }
  BigInteger(const BigInteger& other) { mpz_init_set(_value, other._value); }
  BigInteger(BigInteger&& other) noexcept {
    mpz_init(_value);
    mpz_swap(_value, other._value);
  }
  BigInteger& operator=(const BigInteger& other) {
    mpz_set(_value, other._value);
    return *this;
  }
  BigInteger& operator=(BigInteger&& other) noexcept {
    mpz_swap(_value, other._value);
    return *this;
  }
  ~BigInteger() { mpz_clear(_value); }

  int sign() const { return mpz_sgn(_value); }
  bool isOdd() const { return mpz_odd_p(_value) != 0; }
  bool isDivisibleBy(uint32_t divisor) const { return mpz_divisible_ui_p(_value, divisor) != 0; }
  bool isDivisibleBy(const BigInteger& divisor) const {
    return mpz_divisible_p(_value, divisor._value) != 0;
  }
  bool fitsInt64() const { return mpz_fits_slong_p(_value) != 0; }
  int64_t int64() const { return mpz_get_si(_value); }
  bool fitsUInt64() const { return mpz_fits_ulong_p(_value) != 0; }
  uint64_t uint64() const { return mpz_get_ui(_value); }
  // Whether a Wide holds it; the magnitude has fewer than 128 bits.
  bool fitsWide() const { return mpz_sizeinbase(_value, 2) < 128; }
  Wide wide() const;
  // What holding the value takes.
  size_t bytes() const { return mpz_size(_value) * sizeof(mp_limb_t) + sizeof(*this); }
  // The number of decimal digits, or one more; fast.
  size_t digitsAtMost() const { return mpz_sizeinbase(_value, 10); }
  size_t digits() const;

  void negate() { mpz_neg(_value, _value); }
  void add(const BigInteger& other) { mpz_add(_value, _value, other._value); }
  void subtract(const BigInteger& other) { mpz_sub(_value, _value, other._value); }
  void multiply(const BigInteger& other) { mpz_mul(_value, _value, other._value); }
  void multiplyByPowerOfTen(uint32_t exponent);
  // Truncating division; the receiver becomes the quotient, the answer is the remainder.
  BigInteger divide(const BigInteger& divisor);
  // The caller knows that nothing remains.
  void divideExactly(const BigInteger& divisor) { mpz_divexact(_value, _value, divisor._value); }
  // Divides by `factor` as often as nothing remains; answers how often.
  uint32_t removeFactor(uint32_t factor);

  int compare(const BigInteger& other) const { return mpz_cmp(_value, other._value); }
  int compareMagnitude(const BigInteger& other) const { return mpz_cmpabs(_value, other._value); }
  std::string toString() const;
  uint64_t hash() const;

  // The first digits of a magnitude: 0.ddd times ten to the power of `exponent`. The last digit may
  // be off by one.
  struct Digits {
    static constexpr size_t count = 40;
    std::string text;
    int64_t exponent = 0;
  };
  // Of the value divided by ten to the power of `scale`, in a time that does not depend on either.
  // The value is not zero.
  Digits leadingDigits(uint32_t scale) const;

 private:
  static_assert(sizeof(long) == sizeof(int64_t), "GMP's native integers must have 64 bits");

  mpz_t _value;
};

}  // namespace xquery
