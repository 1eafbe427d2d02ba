#include "Platform/Numbers/BigInteger.h"

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

std::string BigInteger::toString() const {
  std::string text(digitsAtMost() + 2, '\0');  // sign and terminator
  mpz_get_str(text.data(), 10, _value);
  text.resize(text.find('\0'));
  return text;
}

}  // namespace xquery
