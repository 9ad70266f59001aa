declare module '*?worker&inline' {
  const DecoderWorker: new () => Worker;
  export default DecoderWorker;
}

declare module '*.css' {}
