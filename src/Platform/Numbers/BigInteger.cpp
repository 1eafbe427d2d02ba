#include "Platform/Numbers/BigInteger.h"

#include <functional>

namespace xquery {

BigInteger BigInteger::fromUnsigned(uint64_t value) {
  BigInteger result;
  mpz_set_ui(result._value, value);
  return result;
}

BigInteger BigInteger::fromHalves(uint64_t high, uint64_t low) {
  const uint64_t words[] = {low, high};
  BigInteger result;
  mpz_import(result._value, 2, -1, sizeof(uint64_t), 0, 0, words);
  return result;
}

BigInteger BigInteger::fromWide(Wide value) {
  __extension__ using Magnitude = unsigned __int128;
  const Magnitude magnitude = value < 0 ? -static_cast<Magnitude>(value) : Magnitude(value);
  BigInteger result =
      fromHalves(static_cast<uint64_t>(magnitude >> 64), static_cast<uint64_t>(magnitude));
  if (value < 0) result.negate();
  return result;
}

// Of a number of no limbs each is 0.
BigInteger::Wide BigInteger::wide() const {
  static_assert(GMP_NUMB_BITS == 64);
  const Wide magnitude = Wide{mpz_getlimbn(_value, 1)} << 64 | Wide{mpz_getlimbn(_value, 0)};
  return sign() < 0 ? -magnitude : magnitude;
}

BigInteger BigInteger::fromDigits(const std::string& digits) {
  BigInteger result;
  mpz_set_str(result._value, digits.c_str(), 10);
  return result;
}

BigInteger BigInteger::power(uint32_t base, uint32_t exponent) {
  BigInteger result;
  mpz_ui_pow_ui(result._value, base, exponent);
  return result;
}

size_t BigInteger::digits() const {
  const size_t most = digitsAtMost();
  const BigInteger smallestOfThatLength = powerOfTen(static_cast<uint32_t>(most - 1));
  return compareMagnitude(smallestOfThatLength) < 0 && most > 1 ? most - 1 : most;
}

void BigInteger::multiplyByPowerOfTen(uint32_t exponent) {
  if (exponent) multiply(powerOfTen(exponent));
}

BigInteger BigInteger::divide(const BigInteger& divisor) {
  BigInteger remainder;
  mpz_tdiv_qr(_value, remainder._value, _value, divisor._value);
  return remainder;
}

uint32_t BigInteger::removeFactor(uint32_t factor) {
  const BigInteger divisor{int64_t{factor}};
  return static_cast<uint32_t>(mpz_remove(_value, _value, divisor._value));
}

uint64_t BigInteger::hash() const {
  const auto* limbs = reinterpret_cast<const char*>(mpz_limbs_read(_value));
  const size_t hash = std::hash<std::string_view>()({limbs, mpz_size(_value) * sizeof(mp_limb_t)});
  return sign() < 0 ? ~hash : hash;
}

// Each product of the power is cut off, and there are less than twenty: the bits are far more than
// the digits need.
BigInteger::Digits BigInteger::leadingDigits(uint32_t scale) const {
  constexpr mp_bitcnt_t bits = 256;
  mpf_t quotient;
  mpf_t power;
  mpf_init2(quotient, bits);
  mpf_init2(power, bits);
  mpf_set_z(quotient, _value);
  mpf_abs(quotient, quotient);
  mpf_set_ui(power, 10);
  mpf_pow_ui(power, power, scale);
  mpf_div(quotient, quotient, power);
  Digits digits;
  digits.text.resize(Digits::count + 2);
  mp_exp_t exponent = 0;
  mpf_get_str(digits.text.data(), &exponent, 10, Digits::count, quotient);
  mpf_clear(quotient);
  mpf_clear(power);
  digits.text.resize(digits.text.find('\0'));
  digits.text.resize(Digits::count, '0');
  digits.exponent = exponent;
  return digits;
}

std::string BigInteger::toString() const {
  std::string text(digitsAtMost() + 2, '\0');  // sign and terminator
  mpz_get_str(text.data(), 10, _value);
  text.resize(text.find('\0'));
  return text;
}

}  // namespace xquery
