#include "raw/raw_decoder.h"

#include "raw/raw_codec.h"

namespace vox {

namespace {

template <typename Order>
constexpr RawDecoder MakeDecoder(ByteOrder order) {
  using C = RawCodec<Order>;
  return RawDecoder{order,
                    &C::Header,
                    &C::Receiver,
                    &C::TimeRef,
                    &C::Epoch,
                    &C::SatBlock8,
                    &C::SatBlock51,
                    &C::Signal8,
                    &C::Signal51,
                    &C::GpsEphemeris,
                    &C::BdsEphemeris,
                    &C::GlonassEphemeris,
                    &C::SbasEphemeris,
                    &C::GalileoEphemeris,
                    &C::SatPosition,
                    &C::MeteoSensor,
                    &C::MeteoPosition,
                    &C::MeteoSample};
}

constexpr RawDecoder kLittle = MakeDecoder<LittleEndianOrder>(ByteOrder::kLittle);
constexpr RawDecoder kBig = MakeDecoder<BigEndianOrder>(ByteOrder::kBig);

}  // namespace

const RawDecoder& DecoderFor(ByteOrder order) {
  return order == ByteOrder::kBig ? kBig : kLittle;
}

std::optional<ByteOrder> OrderFromSignature(const uint8_t* b) {
  if (b[0] == '$' && b[1] == 'Y' && b[2] == 'R' && b[3] == 'B') return ByteOrder::kLittle;
  if (b[0] == 'B' && b[1] == 'R' && b[2] == 'Y' && b[3] == '$') return ByteOrder::kBig;
  return std::nullopt;
}

bool PassesCheck(const GpsEphemerisRecord& r) {
  return RawCodec<LittleEndianOrder>::Check(r);
}
bool PassesCheck(const GlonassEphemerisRecord& r) {
  return RawCodec<LittleEndianOrder>::Check(r);
}
bool PassesCheck(const SbasEphemerisRecord& r) {
  return RawCodec<LittleEndianOrder>::Check(r);
}
bool PassesCheck(const SatPositionRecord& r) {
  return RawCodec<LittleEndianOrder>::Check(r);
}

}  // namespace vox
