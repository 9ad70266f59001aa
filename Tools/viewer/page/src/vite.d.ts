declare module '*?worker&inline' {
  const DecoderWorker: new () => Worker;
  export default DecoderWorker;
}

declare module '*.css' {}

declare module '#licences' {
  const licences: { name: string; licence: string; text: string }[];
  export default licences;
}
